#include "platform/FileRegistryStore.h"

#include "platform/PosixFiles.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>

#include "config/RegistryFileFormat.h"

namespace tav {

namespace {

std::string ErrnoText(int error) {
  return std::strerror(error);
}

bool ReadAll(int fd, std::string& out) {
  char buffer[65536];
  while (true) {
    ssize_t n = ::read(fd, buffer, sizeof buffer);
    if (n == 0) return true;
    if (n < 0) {
      if (errno == EINTR) continue;
      return false;
    }
    out.append(buffer, static_cast<size_t>(n));
  }
}

}  // namespace

FileRegistryStore::FileRegistryStore(std::string path, ProblemReporter reporter)
    : m_path(std::move(path)), m_reporter(std::move(reporter)) {}

void FileRegistryStore::Report(const std::string& problem) const {
  std::string text = m_path + ": " + problem;
  if (m_reporter) {
    m_reporter(text);
  } else {
    std::fprintf(stderr, "%s\n", text.c_str());
  }
}

int32_t FileRegistryStore::Refresh(bool force) {
  struct stat status {};
  Identity current;
  if (::stat(m_path.c_str(), &status) == 0) {
    current = Identity{true, status.st_dev, status.st_ino, status.st_size,
                       status.st_mtim.tv_sec * 1'000'000'000LL + status.st_mtim.tv_nsec};
  } else if (errno != ENOENT) {
    Report("cannot read settings: " + ErrnoText(errno));
    return kRegistryIoFailed;
  }
  if (!force && m_loaded && current == m_identity) return kRegistryOk;

  if (!current.exists) {
    m_document = RegistryDocument();
    m_identity = current;
    m_loaded = true;
    return kRegistryOk;
  }
  FileDescriptor fd(::open(m_path.c_str(), O_RDONLY | O_CLOEXEC));
  std::string bytes;
  if (fd.Get() < 0 || ::fstat(fd.Get(), &status) != 0 || !ReadAll(fd.Get(), bytes)) {
    if (errno == ENOENT) return Refresh(force);  // replaced between stat and open
    Report("cannot read settings: " + ErrnoText(errno));
    return kRegistryIoFailed;
  }
  // The identity of what was actually read, in case it changed since stat.
  current = Identity{true, status.st_dev, status.st_ino, status.st_size,
                     status.st_mtim.tv_sec * 1'000'000'000LL + status.st_mtim.tv_nsec};
  RegistryFile file = ParseRegistryFile(bytes);
  // Report a file's problems once, not at every forced reload of the same file.
  if (!m_loaded || current != m_identity) {
    for (const auto& problem : file.problems) Report(problem);
  }
  RegistryDocument document;
  ApplyRegistryFile(file, document, /*keepVerbatim=*/true);
  m_document = std::move(document);
  m_identity = current;
  m_loaded = true;
  return kRegistryOk;
}

const RegistryDocument* FileRegistryStore::Content() {
  return Refresh(false) == kRegistryOk ? &m_document : nullptr;
}

int32_t FileRegistryStore::WriteFile(const RegistryDocument& document, Identity& written) {
  struct stat status {};
  int error = ReplaceFileContents(m_path, FormatRegistryFile(document), &status);
  if (error != 0) {
    Report("cannot write settings: " + ErrnoText(error));
    return kRegistryIoFailed;
  }
  written = Identity{true, status.st_dev, status.st_ino, status.st_size,
                     status.st_mtim.tv_sec * 1'000'000'000LL + status.st_mtim.tv_nsec};
  return kRegistryOk;
}

int32_t FileRegistryStore::Update(const std::function<int32_t(RegistryDocument&)>& change) {
  std::error_code error;
  std::filesystem::create_directories(FolderOf(m_path), error);
  if (error) {
    Report("cannot create the settings folder: " + error.message());
    return kRegistryIoFailed;
  }
  FileDescriptor lock(::open((m_path + ".lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
  int locked = -1;
  if (lock.Get() >= 0) {
    do {
      locked = ::flock(lock.Get(), LOCK_EX);
    } while (locked != 0 && errno == EINTR);
  }
  if (locked != 0) {
    Report("cannot lock settings: " + ErrnoText(errno));
    return kRegistryIoFailed;
  }
  // Another writer may have changed the file since it was last read: always
  // start from what is on disk now.
  if (int32_t status = Refresh(true); status != kRegistryOk) return status;
  RegistryDocument working = m_document;
  if (int32_t status = change(working); status != kRegistryOk) return status;
  Identity written;
  if (int32_t status = WriteFile(working, written); status != kRegistryOk) return status;
  m_document = std::move(working);
  m_identity = written;
  return kRegistryOk;  // the lock goes with its descriptor
}

int32_t FileRegistryStore::OpenKey(const std::string& key) {
  if (int32_t status = Refresh(false)) return status;
  return m_document.OpenKey(key);
}

int32_t FileRegistryStore::CreateKey(const std::string& key) {
  if (int32_t status = Refresh(false)) return status;
  if (m_document.OpenKey(key) == kRegistryOk) return kRegistryOk;
  return Update([&](RegistryDocument& document) { return document.CreateKey(key); });
}

int32_t FileRegistryStore::QueryValueInfo(const std::string& key, const std::string& name,
                                          uint32_t& type, uint32_t& length) {
  RegistryValue value;
  if (int32_t status = QueryValue(key, name, value)) return status;
  type = value.type;
  length = value.StoredLength();
  return kRegistryOk;
}

int32_t FileRegistryStore::QueryValue(const std::string& key, const std::string& name,
                                      RegistryValue& value) {
  if (int32_t status = Refresh(false)) return status;
  return m_document.QueryValue(key, name, value);
}

int32_t FileRegistryStore::SetValue(const std::string& key, const std::string& name,
                                    const RegistryValue& value) {
  return Update([&](RegistryDocument& document) { return document.SetValue(key, name, value); });
}

int32_t FileRegistryStore::DeleteValue(const std::string& key, const std::string& name) {
  return Update([&](RegistryDocument& document) { return document.DeleteValue(key, name); });
}

int32_t FileRegistryStore::DeleteKey(const std::string& key) {
  return Update([&](RegistryDocument& document) { return document.DeleteKey(key); });
}

int32_t FileRegistryStore::EnumSubKeys(const std::string& key, std::vector<std::string>& names) {
  if (int32_t status = Refresh(false)) return status;
  return m_document.EnumSubKeys(key, names);
}

int32_t FileRegistryStore::EnumValues(const std::string& key,
                                      std::vector<NamedRegistryValue>& values) {
  if (int32_t status = Refresh(false)) return status;
  return m_document.EnumValues(key, values);
}

int32_t FileRegistryStore::QueryKeyInfo(const std::string& key, RegistryKeyInfo& info) {
  if (int32_t status = Refresh(false)) return status;
  return m_document.QueryKeyInfo(key, info);
}

}  // namespace tav
