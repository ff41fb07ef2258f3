#pragma once
// The RegistryStore on Unix: a text file in the registry export format,
// shared with showctl and any other program of the user.
//
// Reads answer from the file's content as last loaded, reloading first when
// the file has changed (device, inode, size or modification time differ), so
// a change made by another program counts at the next read. (A rewrite in
// place that keeps the size, within the file system's timestamp granularity
// of the last load, can go unseen until the next change; the suite's writers
// replace the file, which changes its inode.)
//
// Every change is one transaction: take an exclusive lock on
// "<file>.lock", reload, apply, write a temporary file beside it, sync it,
// rename it over the file and sync the folder. Writers therefore never lose
// each other's values, and a crash leaves either the old file or the new
// one. A lock held by a process that died is released by the kernel.
//
// The lock is only ever tried, never waited for, because the player's one
// thread must not stop while another program (a slow showctl, an editor on
// a network share) holds it. A change made while the lock is taken is kept:
// it is applied to the content this store answers from at once (reads see
// it), queued, and written in a later transaction, replayed on top of
// whatever the other program wrote meanwhile. The queue is tried again from
// the retry timer (every kRetryIntervalMs, when a TimerService is given),
// before each later call of the store, by WritePendingChanges, and finally
// by the destructor, which waits at most kFinalWaitMs for the lock and
// reports changes it still could not write. A change that no longer applies
// when replayed is reported and dropped.
//
// A missing file is an empty registry; the first change creates the file and
// its folder. Content the program does not know is written back as it was.
// Lines that cannot be read are reported through the problem reporter (each
// time a changed file is loaded), skipped, and kept in the file. I/O failures
// are reported too and answer kRegistryIoFailed. At construction the
// temporaries that a crashed writer left beside the file are removed. A file
// that is a symbolic link stays one; the file it leads to is rewritten.
//
// Owned by the program's entry point (or a showctl command); single-threaded.
// The timer service, when given, must outlive the store.

#include <sys/types.h>

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "config/RegistryDocument.h"
#include "config/RegistryStore.h"
#include "ports/TimerService.h"

namespace tav {

class FileRegistryStore : public RegistryStore {
 public:
  using ProblemReporter = std::function<void(const std::string& problem)>;

  static constexpr uint32_t kRetryIntervalMs = 100;
  static constexpr std::chrono::milliseconds kFinalWaitMs{2000};

  // Problems go to standard error unless a reporter is given. Without a
  // timer service, pending changes wait for the store's next call.
  explicit FileRegistryStore(std::string path, ProblemReporter reporter = nullptr,
                             TimerService* retryTimers = nullptr);
  ~FileRegistryStore() override;
  FileRegistryStore(const FileRegistryStore&) = delete;
  FileRegistryStore& operator=(const FileRegistryStore&) = delete;

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

  // Applies `change` to the current content and writes it as one
  // transaction, now or, while another program holds the lock, later (see
  // above), so `change` must not refer to anything that may go before the
  // store. Returns the change's status; nothing is written or queued when
  // it is not kRegistryOk. kRegistryIoFailed when the file cannot be
  // written.
  int32_t Update(const std::function<int32_t(RegistryDocument&)>& change);
  // Changes accepted but not yet in the file.
  bool HasPendingChanges() const { return !m_pending.empty(); }
  // Writes the pending changes, waiting for the lock at most `wait` (zero:
  // one try). True when every change accepted so far is in the file. For
  // tools that end soon, and for the end of the program; never from the
  // player's loop with a wait.
  bool WritePendingChanges(std::chrono::milliseconds wait = {});
  // Forgets the changes not yet written (a tool that gives up on them).
  void DropPendingChanges();
  // The current content, reloaded if the file changed; nothing on an I/O
  // failure (reported).
  const RegistryDocument* Content();
  const std::string& Path() const { return m_path; }

 private:
  using Change = std::function<int32_t(RegistryDocument&)>;
  enum class Attempt { kWritten, kLocked, kFailed };

  struct Identity {
    bool exists = false;
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    long long mtimeNs = 0;
    bool operator==(const Identity&) const = default;
  };

  // Brings the content up to date: tries the pending changes, reloads when
  // the file changed, and lays what is still pending over it.
  int32_t Refresh();
  // Reloads when the file changed, or always with `force`.
  int32_t Load(bool force);
  // One try at writing the pending changes.
  Attempt TryWritePending();
  int32_t WriteFile(const RegistryDocument& document, Identity& written);
  void Report(const std::string& problem) const;

  std::string m_path;
  ProblemReporter m_reporter;
  RegistryDocument m_document;
  Identity m_identity;
  bool m_loaded = false;
  std::vector<Change> m_pending;
  bool m_lockReported = false;
  std::unique_ptr<Timer> m_retryTimer;
};

}  // namespace tav
