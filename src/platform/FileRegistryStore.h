#pragma once
// The RegistryStore on Unix: a text file in the registry export format,
// shared with showctl and any other program of the user.
//
// Reads answer from the file's content as last loaded, reloading first when
// the file has changed (device, inode, size or modification time differ), so
// a change made by another program counts at the next read. (A rewrite in
// place that keeps the size, within the file system's timestamp granularity
// of the last load, can go unseen until the next change; the suite's writers
// replace the file, which changes its inode.) Every change is
// one transaction: take an exclusive lock on "<file>.lock", reload, apply,
// write a temporary file beside it, sync it, rename it over the file and sync
// the folder. Writers therefore never lose each other's values, and a crash
// leaves either the old file or the new one. A lock held by a process that
// died is released by the kernel.
//
// A missing file is an empty registry; the first change creates the file and
// its folder. Content the program does not know is written back as it was.
// Lines that cannot be read are reported through the problem reporter (each
// time a changed file is loaded), skipped, and kept in the file. I/O failures
// are reported too and answer kRegistryIoFailed.
//
// Owned by the program's entry point (or a showctl command); single-threaded.

#include <sys/types.h>
#include <functional>
#include <string>

#include "config/RegistryDocument.h"
#include "config/RegistryStore.h"

namespace tav {

class FileRegistryStore : public RegistryStore {
 public:
  using ProblemReporter = std::function<void(const std::string& problem)>;

  // Problems go to standard error unless a reporter is given.
  explicit FileRegistryStore(std::string path, ProblemReporter reporter = nullptr);

  int32_t OpenKey(const std::string& key) override;
  int32_t CreateKey(const std::string& key) override;
  int32_t QueryValueInfo(const std::string& key, const std::string& name, uint32_t& type,
                         uint32_t& length) override;
  int32_t QueryValue(const std::string& key, const std::string& name,
                     RegistryValue& value) override;
  int32_t SetValue(const std::string& key, const std::string& name,
                   const RegistryValue& value) override;
  int32_t DeleteValue(const std::string& key, const std::string& name) override;
  int32_t DeleteKey(const std::string& key) override;
  int32_t EnumSubKeys(const std::string& key, std::vector<std::string>& names) override;
  int32_t EnumValues(const std::string& key, std::vector<NamedRegistryValue>& values) override;
  int32_t QueryKeyInfo(const std::string& key, RegistryKeyInfo& info) override;

  // Applies `change` to the current content as one transaction; the file is
  // written only when it returns kRegistryOk, and its status is returned.
  int32_t Update(const std::function<int32_t(RegistryDocument&)>& change);
  // The current content, reloaded if the file changed; nothing on an I/O
  // failure (reported).
  const RegistryDocument* Content();
  const std::string& Path() const { return m_path; }

 private:
  struct Identity {
    bool exists = false;
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    long long mtimeNs = 0;
    bool operator==(const Identity&) const = default;
  };

  // Reloads when the file changed, or always with `force`.
  int32_t Refresh(bool force);
  int32_t WriteFile(const RegistryDocument& document, Identity& written);
  void Report(const std::string& problem) const;

  std::string m_path;
  ProblemReporter m_reporter;
  RegistryDocument m_document;
  Identity m_identity;
  bool m_loaded = false;
};

}  // namespace tav
