// The real file system through POSIX calls.

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "platform/LocalFileSystem.h"
#include "platform/PosixFiles.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

class LocalFile : public RandomAccessFile {
 public:
  LocalFile(int fd, uint64_t size, std::string name)
      : m_fd(fd), m_size(size), m_name(std::move(name)) {}
  ~LocalFile() override { ::close(m_fd); }
  LocalFile(const LocalFile&) = delete;
  LocalFile& operator=(const LocalFile&) = delete;

  uint64_t Size() const override { return m_size; }
  const std::string& Name() const override { return m_name; }

  size_t ReadAt(uint64_t offset, void* buffer, size_t count) const override {
    size_t done = 0;
    auto* out = static_cast<char*>(buffer);
    while (done < count) {
      ssize_t n = ::pread(m_fd, out + done, count - done, static_cast<off_t>(offset + done));
      if (n < 0) {
        if (errno == EINTR) continue;
        throw seqerrors::FileAccess("FileSystem.ReadAt", m_name + ": " + std::strerror(errno));
      }
      if (n == 0) break;
      done += static_cast<size_t>(n);
    }
    return done;
  }

 private:
  int m_fd;
  uint64_t m_size;
  std::string m_name;
};

class LocalWritableFile : public WritableFile {
 public:
  explicit LocalWritableFile(std::string path) : m_path(std::move(path)) {
    Check(m_file.Open(m_path));
  }

  void Append(std::string_view bytes) override {
    Check(m_file.Append(bytes));
    m_size += bytes.size();
  }
  void WriteAt(uint64_t offset, std::string_view bytes) override {
    if (offset > m_size || bytes.size() > m_size - offset) {
      throw seqerrors::FileAccess("FileSystem.WriteAt", m_path + ": write past the end");
    }
    Check(m_file.WriteAt(offset, bytes));
  }
  uint64_t Size() const override { return m_size; }
  void Commit() override { Check(m_file.Commit()); }

 private:
  void Check(int error) const {
    if (error != 0) {
      throw seqerrors::FileAccess("FileSystem.Write", m_path + ": " + std::strerror(error));
    }
  }

  std::string m_path;
  ReplacementFile m_file;
  uint64_t m_size = 0;
};

class LocalFileSystemImpl : public FileSystem {
 public:
  FileStatus Stat(const std::string& path) const override {
    FileStatus status;
    struct stat st {};
    if (path.empty() || ::stat(path.c_str(), &st) != 0) return status;
    status.exists = true;
    status.isDirectory = S_ISDIR(st.st_mode);
    status.modifiedNs = static_cast<int64_t>(st.st_mtim.tv_sec) * 1000000000 + st.st_mtim.tv_nsec;
    status.size = static_cast<uint64_t>(st.st_size);
    return status;
  }

  std::unique_ptr<RandomAccessFile> OpenForRead(const std::string& path) const override {
    int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
      if (errno == ENOENT || errno == ENOTDIR)
        throw seqerrors::FileNotFound("FileSystem.OpenForRead", path);
      throw seqerrors::FileAccess("FileSystem.OpenForRead", path + ": " + std::strerror(errno));
    }
    struct stat st {};
    if (::fstat(fd, &st) != 0 || S_ISDIR(st.st_mode)) {
      ::close(fd);
      throw seqerrors::FileAccess("FileSystem.OpenForRead", path + ": not a readable file");
    }
    return std::make_unique<LocalFile>(fd, static_cast<uint64_t>(st.st_size), path);
  }

  void WriteAll(const std::string& path, std::string_view bytes) override {
    WriteAll(path, bytes, {});
  }

  void WriteAll(const std::string& path, std::string_view bytes,
                const std::function<void()>& progress) override {
    int error = ReplaceFileContents(path, bytes, nullptr, progress);
    if (error != 0) {
      throw seqerrors::FileAccess("FileSystem.WriteAll", path + ": " + std::strerror(error));
    }
  }

  std::unique_ptr<WritableFile> OpenForWrite(const std::string& path) override {
    return std::make_unique<LocalWritableFile>(path);
  }

  std::vector<std::string> ListDirectory(const std::string& path) const override {
    std::vector<std::string> names;
    DIR* dir = ::opendir(path.c_str());
    if (dir == nullptr) return names;
    while (dirent* entry = ::readdir(dir)) {
      std::string name = entry->d_name;
      if (name != "." && name != "..") names.push_back(std::move(name));
    }
    ::closedir(dir);
    return names;
  }
};

}  // namespace

std::shared_ptr<FileSystem> LocalFileSystem() {
  return std::make_shared<LocalFileSystemImpl>();
}

}  // namespace tav
