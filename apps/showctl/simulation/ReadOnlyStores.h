#pragma once
// What a simulation reads the user's files through, so that it changes
// nothing on disk whatever the engine does:
//  - ReadOnlyFileSystem, the sequence library's file system: reads pass
//    through, every write fails with the access error (75) naming the file;
//  - SnapshotTextFiles, the schedule and show files: each file is read once
//    and then served from memory (the host reads the current show file again
//    every second; a simulation takes the files as they were when first
//    read), and writes fail;
//  - ExportSkippingLibrary, the sequence library: compressed exports that
//    the player would write beside the sequences are reported to a callback
//    instead of written.
// Single-threaded, as everything on the player's loop.

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>

#include "schedule/TextFileStore.h"
#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/SequenceLibrary.h"

namespace tav::simulation {

class ReadOnlyFileSystem : public FileSystem {
 public:
  explicit ReadOnlyFileSystem(std::shared_ptr<const FileSystem> files)
      : m_files(std::move(files)) {}

  FileStatus Stat(const std::string& path) const override { return m_files->Stat(path); }
  std::unique_ptr<RandomAccessFile> OpenForRead(const std::string& path) const override {
    return m_files->OpenForRead(path);
  }
  std::string ReadAll(const std::string& path) const override { return m_files->ReadAll(path); }
  void WriteAll(const std::string& path, std::string_view bytes) override;
  void WriteAll(const std::string& path, std::string_view bytes,
                const std::function<void()>& progress) override;
  std::unique_ptr<WritableFile> OpenForWrite(const std::string& path) override;
  std::vector<std::string> ListDirectory(const std::string& path) const override {
    return m_files->ListDirectory(path);
  }

 private:
  std::shared_ptr<const FileSystem> m_files;
};

class SnapshotTextFiles : public TextFileStore {
 public:
  explicit SnapshotTextFiles(TextFileStore& files) : m_files(files) {}

  // A read that fails is not kept: it fails again the next time.
  std::optional<std::string> ReadText(const std::string& path) override;
  void WriteText(const std::string& path, std::string_view text) override;

 private:
  TextFileStore& m_files;
  std::map<std::string, std::optional<std::string>> m_read;
};

class ExportSkippingLibrary : public SequenceLibrary {
 public:
  using OnExport = std::function<void(const std::string& path)>;
  ExportSkippingLibrary(std::shared_ptr<SequenceLibrary> library, OnExport onExport)
      : m_library(std::move(library)), m_onExport(std::move(onExport)) {}

  std::shared_ptr<Sequence> CreateSequence() override { return m_library->CreateSequence(); }
  std::shared_ptr<Sequence> LoadCompressed(const std::string& path) override {
    return m_library->LoadCompressed(path);
  }
  void WriteCompressed(const Sequence& sequence, const std::string& path) override;
  std::optional<uint64_t> CurrentSourceHash(
      const std::string& sequencePath, const std::vector<std::string>& includedFiles) override {
    return m_library->CurrentSourceHash(sequencePath, includedFiles);
  }

 private:
  std::shared_ptr<SequenceLibrary> m_library;
  OnExport m_onExport;
};

}  // namespace tav::simulation
