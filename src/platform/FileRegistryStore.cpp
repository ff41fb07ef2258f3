#include "platform/FileRegistryStore.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <thread>

#include "config/RegistryFileFormat.h"
#include "platform/PosixFiles.h"

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

FileRegistryStore::FileRegistryStore(std::string path, ProblemReporter reporter,
                                     TimerService* retryTimers)
    : m_path(std::move(path)), m_reporter(std::move(reporter)) {
  RemoveStaleTemporaries(FolderOf(m_path));
  if (retryTimers != nullptr) {
    m_retryTimer = retryTimers->CreateTimer("tmrSettingsRetry", kRetryIntervalMs, false,
                                            [this] { TryWritePending(); });
  }
}

FileRegistryStore::~FileRegistryStore() {
  if (m_pending.empty()) return;
  size_t count = m_pending.size();
  if (!WritePendingChanges(kFinalWaitMs)) {
    Report(std::to_string(count) + " settings change(s) could not be written");
  }
}

void FileRegistryStore::Report(const std::string& problem) const {
  std::string text = m_path + ": " + problem;
  if (m_reporter) {
    m_reporter(text);
  } else {
    std::fprintf(stderr, "%s\n", text.c_str());
  }
}

int32_t FileRegistryStore::Refresh() {
  if (!m_pending.empty()) TryWritePending();
  bool wasLoaded = m_loaded;
  Identity before = m_identity;
  if (int32_t status = Load(false); status != kRegistryOk) return status;
  // Reloaded while changes wait for the lock: they still count for reads.
  if (!m_pending.empty() && (!wasLoaded || !(before == m_identity))) {
    for (const auto& change : m_pending) change(m_document);
  }
  return kRegistryOk;
}

int32_t FileRegistryStore::Load(bool force) {
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
    if (errno == ENOENT) return Load(force);  // replaced between stat and open
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
  return Refresh() == kRegistryOk ? &m_document : nullptr;
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
  if (int32_t status = Refresh(); status != kRegistryOk) return status;
  RegistryDocument working = m_document;
  if (int32_t status = change(working); status != kRegistryOk) return status;
  m_document = std::move(working);
  m_pending.push_back(change);
  return TryWritePending() == Attempt::kFailed ? kRegistryIoFailed : kRegistryOk;
}

FileRegistryStore::Attempt FileRegistryStore::TryWritePending() {
  auto finish = [this](Attempt attempt) {
    m_pending.clear();
    m_lockReported = false;
    if (m_retryTimer) m_retryTimer->SetEnabled(false);
    // After a failure the content is read again: what was not written is gone.
    if (attempt == Attempt::kFailed) m_loaded = false;
    return attempt;
  };
  if (m_pending.empty()) return finish(Attempt::kWritten);
  FileDescriptor lock(::open((m_path + ".lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
  int locked = -1;
  if (lock.Get() >= 0) {
    do {
      locked = ::flock(lock.Get(), LOCK_EX | LOCK_NB);
    } while (locked != 0 && errno == EINTR);
  }
  if (locked != 0 && lock.Get() >= 0 && errno == EWOULDBLOCK) {
    if (!m_lockReported) {
      Report("settings locked by another program; the change is kept and written when it lets go");
      m_lockReported = true;
    }
    if (m_retryTimer && !m_retryTimer->Enabled()) m_retryTimer->SetEnabled(true);
    return Attempt::kLocked;
  }
  if (locked != 0) {
    Report("cannot lock settings: " + ErrnoText(errno));
    return finish(Attempt::kFailed);
  }
  // Another writer may have changed the file since it was last read: always
  // start from what is on disk now, and replay the changes on top of it.
  if (Load(true) != kRegistryOk) return finish(Attempt::kFailed);
  RegistryDocument working = m_document;
  for (const auto& change : m_pending) {
    if (change(working) != kRegistryOk) {
      Report(
          "a settings change no longer applies to the file as another program left it; "
          "dropped");
    }
  }
  Identity written;
  if (WriteFile(working, written) != kRegistryOk) return finish(Attempt::kFailed);
  m_document = std::move(working);
  m_identity = written;
  return finish(Attempt::kWritten);  // the lock goes with its descriptor
}

void FileRegistryStore::DropPendingChanges() {
  if (m_pending.empty()) return;
  m_pending.clear();
  m_lockReported = false;
  if (m_retryTimer) m_retryTimer->SetEnabled(false);
  m_loaded = false;  // read the file again: the dropped changes are gone
}

bool FileRegistryStore::WritePendingChanges(std::chrono::milliseconds wait) {
  auto deadline = std::chrono::steady_clock::now() + wait;
  Attempt attempt;
  while ((attempt = TryWritePending()) == Attempt::kLocked) {
    if (std::chrono::steady_clock::now() >= deadline) return false;
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  return attempt == Attempt::kWritten;
}

int32_t FileRegistryStore::OpenKey(const std::string& key) {
  if (int32_t status = Refresh()) return status;
  return m_document.OpenKey(key);
}

int32_t FileRegistryStore::CreateKey(const std::string& key) {
  if (int32_t status = Refresh()) return status;
  if (m_document.OpenKey(key) == kRegistryOk) return kRegistryOk;
  return Update([key](RegistryDocument& document) { return document.CreateKey(key); });
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
  if (int32_t status = Refresh()) return status;
  return m_document.QueryValue(key, name, value);
}

int32_t FileRegistryStore::SetValue(const std::string& key, const std::string& name,
                                    const RegistryValue& value) {
  return Update([key, name, value](RegistryDocument& document) {
    return document.SetValue(key, name, value);
  });
}

int32_t FileRegistryStore::DeleteValue(const std::string& key, const std::string& name) {
  return Update(
      [key, name](RegistryDocument& document) { return document.DeleteValue(key, name); });
}

int32_t FileRegistryStore::DeleteKey(const std::string& key) {
  return Update([key](RegistryDocument& document) { return document.DeleteKey(key); });
}

int32_t FileRegistryStore::EnumSubKeys(const std::string& key, std::vector<std::string>& names) {
  if (int32_t status = Refresh()) return status;
  return m_document.EnumSubKeys(key, names);
}

int32_t FileRegistryStore::EnumValues(const std::string& key,
                                      std::vector<NamedRegistryValue>& values) {
  if (int32_t status = Refresh()) return status;
  return m_document.EnumValues(key, values);
}

int32_t FileRegistryStore::QueryKeyInfo(const std::string& key, RegistryKeyInfo& info) {
  if (int32_t status = Refresh()) return status;
  return m_document.QueryKeyInfo(key, info);
}

}  // namespace tav
