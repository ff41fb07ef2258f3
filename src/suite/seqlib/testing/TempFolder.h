#pragma once
// A fresh folder under the test temporary directory, removed with its
// contents when the object goes. For tests that want real files.

#include <string>
#include <string_view>

namespace tav {

class TempFolder {
 public:
  TempFolder();
  ~TempFolder();
  TempFolder(const TempFolder&) = delete;
  TempFolder& operator=(const TempFolder&) = delete;

  // The folder, ending with '/'.
  const std::string& Path() const { return m_path; }
  // Writes a file (creating folders on the way); returns its full path.
  std::string Write(const std::string& relative, std::string_view bytes) const;
  std::string Read(const std::string& relative) const;
  // Sets the modification time, seconds since the Unix epoch.
  void SetModified(const std::string& relative, int64_t seconds) const;

 private:
  std::string m_path;
};

}  // namespace tav
