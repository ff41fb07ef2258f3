#pragma once
// A fresh folder of the test's own under the temporary directory, removed
// with its contents when the object goes. Every test that touches real files
// makes one, so two runs (or two CI jobs on one machine) never meet.

#include <cstdint>
#include <string>
#include <string_view>

namespace tav {

class TempFolder {
 public:
  // `prefix` names the folder so that a leftover one says who made it.
  explicit TempFolder(std::string_view prefix = "tav-test");
  ~TempFolder();
  TempFolder(const TempFolder&) = delete;
  TempFolder& operator=(const TempFolder&) = delete;

  // The folder, ending with '/'.
  const std::string& Path() const { return m_path; }
  // The full path of a file inside the folder.
  std::string operator/(std::string_view relative) const { return m_path + std::string(relative); }
  // Writes a file (creating folders on the way); returns its full path.
  std::string Write(const std::string& relative, std::string_view bytes) const;
  std::string Read(const std::string& relative) const;
  bool Exists(const std::string& relative) const;
  // Sets the modification time, seconds since the Unix epoch.
  void SetModified(const std::string& relative, int64_t seconds) const;

 private:
  std::string m_path;
};

}  // namespace tav
