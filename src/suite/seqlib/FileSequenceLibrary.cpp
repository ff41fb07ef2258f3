#include "suite/seqlib/FileSequenceLibrary.h"

#include <algorithm>

#include "suite/seqlib/CompiledEventStream.h"
#include "suite/seqlib/CompressedSequence.h"
#include "suite/seqlib/CompressedSequenceReader.h"
#include "suite/seqlib/ContentHash.h"
#include "suite/seqlib/FseqConversion.h"
#include "suite/seqlib/FseqEventStream.h"
#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

constexpr const char* kSource = "SequenceLibrary.Load";

enum class Format { Plain, Fseq, Compressed };

std::string Directory(const std::string& path) {
  auto slash = path.find_last_of('/');
  return slash == std::string::npos ? std::string() : path.substr(0, slash + 1);
}

std::vector<int32_t> FamiliesOf(const CompiledSequence& compiled) {
  std::vector<int32_t> families;
  for (int32_t family : {kFamilyTAV, kFamilyX10, kFamilyFennick, kFamilyDMX}) {
    if (compiled.UsesFamily(family)) families.push_back(family);
  }
  return families;
}

}  // namespace

struct FileSequenceLibrary::Core {
  std::shared_ptr<FileSystem> fileSystem;
  std::shared_ptr<const PathResolver> resolver;
  UniverseMap universes;

  Format Detect(const RandomAccessFile& file) const {
    char head[16] = {};
    size_t n = file.ReadAt(0, head, sizeof head);
    std::string_view bytes(head, n);
    if (FseqFile::LooksLikeFseq(head, n)) return Format::Fseq;
    if (LooksLikeCompressedSequence(bytes)) return Format::Compressed;
    if (LooksLikePlainSequence(bytes)) return Format::Plain;
    // A plain text may start with a long run of blanks; look further.
    if (n == sizeof head && file.Size() > n) {
      std::string more(std::min<uint64_t>(file.Size(), 4096), '\0');
      more.resize(file.ReadAt(0, more.data(), more.size()));
      if (LooksLikePlainSequence(more)) return Format::Plain;
    }
    throw seqerrors::InvalidFormat(kSource,
                                   file.Name() +
                                       " is not a sequence this program knows (plain JSON, FSEQ or "
                                       "compressed export)");
  }

  std::shared_ptr<RandomAccessFile> Open(const std::string& path) const {
    if (!fileSystem->Stat(path).IsFile()) throw seqerrors::FileNotFound(kSource, path);
    return fileSystem->OpenForRead(path);
  }

  std::string ResolveSubsequence(const std::string& name, const std::string& includingPath) const {
    if (PathResolver::IsAbsolute(name) && fileSystem->Stat(name).IsFile()) return name;
    if (!PathResolver::IsAbsolute(name) && !PathResolver::IsForeignAbsolute(name)) {
      std::string beside = Directory(includingPath) + name;
      std::replace(beside.begin(), beside.end(), '\\', '/');
      if (fileSystem->Stat(beside).IsFile()) return beside;
    }
    std::string resolved =
        resolver ? resolver->ResolvePath(name, PathResolver::kKindSequence) : name;
    if (fileSystem->Stat(resolved).IsFile()) return resolved;
    std::string compressed = resolved + "." + kCompressedExtension;
    if (fileSystem->Stat(compressed).IsFile()) return compressed;
    throw seqerrors::FileNotFound(kSource, name + " (subsequence of " + includingPath + ")");
  }

  std::shared_ptr<const CompiledSequence> CompilePlain(const std::string& path,
                                                       const std::string& text,
                                                       const std::function<void()>& keepAlive,
                                                       std::vector<std::string>& including) const {
    uint64_t hash = ContentHash(text);
    if (keepAlive) keepAlive();
    SequenceData data = ParsePlainSequence(text, path, keepAlive);
    if (keepAlive) keepAlive();
    including.push_back(path);
    auto loadSub = [&](const SubsequenceRef& ref) {
      std::string subPath = ResolveSubsequence(ref.file, path);
      if (std::find(including.begin(), including.end(), subPath) != including.end()) {
        std::string chain;
        for (const auto& p : including) chain += p + " includes ";
        throw seqerrors::InvalidFormat(kSource,
                                       "subsequences include each other: " + chain + subPath);
      }
      if (static_cast<int>(including.size()) >= kMaxSubsequenceDepth) {
        throw seqerrors::InvalidFormat(kSource, path + ": subsequences nest deeper than " +
                                                    std::to_string(kMaxSubsequenceDepth) +
                                                    " levels");
      }
      return LoadCompiled(subPath, keepAlive, including);
    };
    auto compiled = std::make_shared<CompiledSequence>(Compile(data, loadSub));
    including.pop_back();
    compiled->sourceHash = hash;
    return compiled;
  }

  std::shared_ptr<const CompiledSequence> LoadCompiled(const std::string& path,
                                                       const std::function<void()>& keepAlive,
                                                       std::vector<std::string>& including) const {
    auto file = Open(path);
    switch (Detect(*file)) {
      case Format::Compressed:
        return std::make_shared<CompiledSequence>(
            ReadCompressedSequence(fileSystem->ReadAll(path), path));
      case Format::Fseq: {
        FseqFile fseq(file);
        auto compiled = std::make_shared<CompiledSequence>(
            Compile(FseqToSequenceData(fseq, universes, keepAlive),
                    [](const SubsequenceRef&) { return nullptr; }));
        compiled->sourceHash = ContentHash(fileSystem->ReadAll(path));
        return compiled;
      }
      case Format::Plain:
      default:
        return CompilePlain(path, fileSystem->ReadAll(path), keepAlive, including);
    }
  }

  std::shared_ptr<const SequenceContent> FromCompiled(
      std::shared_ptr<const CompiledSequence> compiled, const std::string& format,
      const std::string& path, std::function<bool()> exported) const {
    auto content = std::make_shared<SequenceContent>();
    SequenceInfo& info = content->info;
    info.format = format;
    info.path = path;
    info.lengthMs = compiled->lengthMs;
    info.media = compiled->media;
    info.shellCommand = compiled->shellCommand;
    info.subsequences = compiled->subsequences;
    info.families = FamiliesOf(*compiled);
    info.channelCount = compiled->channels.size();
    info.effectCount = compiled->effects.size();
    info.frameCount = compiled->TimelineFrameCount();
    info.levelBlockCount = compiled->LevelBlockCount();
    info.sourceHash = compiled->sourceHash;
    content->compiled = compiled;
    content->openStream = [compiled] { return std::make_unique<CompiledEventStream>(compiled); };
    content->hasBeenExported = std::move(exported);
    return content;
  }

  std::shared_ptr<const SequenceContent> Load(const std::string& path,
                                              const std::function<void()>& keepAlive) const {
    auto file = Open(path);
    switch (Detect(*file)) {
      case Format::Fseq: {
        std::shared_ptr<const RandomAccessFile> shared = file;
        FseqFile fseq(shared);
        auto content = std::make_shared<SequenceContent>();
        SequenceInfo& info = content->info;
        info.format = "fseq";
        info.path = path;
        info.lengthMs = static_cast<int64_t>(fseq.DurationMs());
        info.media = fseq.MediaFilename();
        info.families = {kFamilyDMX};
        uint64_t channels = 0;
        for (const auto& range : fseq.Ranges()) channels += range.count;
        info.channelCount = channels;
        info.frameCount = fseq.FrameCount();
        info.levelBlockCount =
            static_cast<size_t>(fseq.FrameCount()) * FseqSegments(fseq, universes).size();
        UniverseMap map = universes;
        content->openStream = [shared, map] {
          return std::make_unique<FseqEventStream>(std::make_unique<FseqFile>(shared), map);
        };
        // Nothing to gain from an export: FSEQ is already a compiled form.
        content->hasBeenExported = [] { return true; };
        return content;
      }
      case Format::Compressed:
        return FromCompiled(std::make_shared<CompiledSequence>(
                                ReadCompressedSequence(fileSystem->ReadAll(path), path)),
                            "tcs", path, [] { return true; });
      case Format::Plain:
      default: {
        std::vector<std::string> including;
        auto compiled = CompilePlain(path, fileSystem->ReadAll(path), keepAlive, including);
        auto fs = fileSystem;
        uint64_t hash = compiled->sourceHash;
        std::string exportPath = path + "." + kCompressedExtension;
        return FromCompiled(compiled, "plain", path, [fs, hash, exportPath] {
          if (!fs->Stat(exportPath).IsFile()) return false;
          try {
            auto file = fs->OpenForRead(exportPath);
            char header[kCompressedHeaderBytes] = {};
            size_t n = file->ReadAt(0, header, sizeof header);
            auto recorded = ReadCompressedSourceHash(std::string_view(header, n));
            return recorded && *recorded == hash;
          } catch (const Error&) {
            return false;
          }
        });
      }
    }
  }
};

FileSequenceLibrary::FileSequenceLibrary(std::shared_ptr<const Clock> clock,
                                         std::shared_ptr<FileSystem> fileSystem,
                                         std::shared_ptr<const PathResolver> resolver,
                                         UniverseMap universes)
    : m_clock(std::move(clock)),
      m_core(std::make_shared<Core>(
          Core{std::move(fileSystem), std::move(resolver), std::move(universes)})) {
  if (!m_clock || !m_core->fileSystem) throw errors::ObjectNotSet("FileSequenceLibrary");
}

void FileSequenceLibrary::SetUniverseMap(const UniverseMap& universes) {
  // Sequences made earlier keep the core they were made with.
  m_core = std::make_shared<Core>(Core{m_core->fileSystem, m_core->resolver, universes});
}

std::shared_ptr<Sequence> FileSequenceLibrary::CreateSequence() {
  std::shared_ptr<const Core> core = m_core;
  return std::make_shared<Sequence>(
      m_clock, [core](const std::string& path, const std::function<void()>& keepAlive) {
        return core->Load(path, keepAlive);
      });
}

std::shared_ptr<Sequence> FileSequenceLibrary::LoadCompressed(const std::string& path) {
  auto sequence = CreateSequence();
  auto file = m_core->Open(path);
  if (m_core->Detect(*file) != Format::Compressed) {
    throw seqerrors::InvalidFormat("SequenceLibrary.LoadCompressed",
                                   path + " is not a compressed sequence");
  }
  sequence->Attach(m_core->FromCompiled(std::make_shared<CompiledSequence>(ReadCompressedSequence(
                                            m_core->fileSystem->ReadAll(path), path)),
                                        "tcs", path, [] { return true; }));
  return sequence;
}

void FileSequenceLibrary::WriteCompressed(const Sequence& sequence, const std::string& path) {
  auto content = sequence.Content();
  if (!content) throw errors::ObjectNotSet("SequenceLibrary.WriteCompressed");
  auto compiled = content->compiled ? content->compiled : LoadCompiled(content->info.path);
  m_core->fileSystem->WriteAll(path, WriteCompressedSequence(*compiled));
}

std::shared_ptr<const SequenceContent> FileSequenceLibrary::LoadContent(
    const std::string& path, const std::function<void()>& keepAlive) const {
  return m_core->Load(path, keepAlive);
}

std::shared_ptr<const CompiledSequence> FileSequenceLibrary::LoadCompiled(
    const std::string& path, const std::function<void()>& keepAlive) const {
  std::vector<std::string> including;
  return m_core->LoadCompiled(path, keepAlive, including);
}

std::string FileSequenceLibrary::FormatOf(const std::string& path) const {
  switch (m_core->Detect(*m_core->Open(path))) {
    case Format::Fseq:
      return "fseq";
    case Format::Compressed:
      return "tcs";
    case Format::Plain:
    default:
      return "plain";
  }
}

std::unique_ptr<StreamedSequence> FileSequenceLibrary::OpenStreamed(const std::string& path,
                                                                    bool hashFseq) const {
  std::shared_ptr<RandomAccessFile> file = m_core->Open(path);
  switch (m_core->Detect(*file)) {
    case Format::Fseq: {
      uint64_t hash = hashFseq ? ContentHash(*file) : 0;
      return std::make_unique<FseqStreamedSequence>(std::make_unique<FseqFile>(file),
                                                    m_core->universes, hash);
    }
    case Format::Compressed:
      return std::make_unique<CompressedSequenceReader>(file);
    case Format::Plain:
    default:
      return std::make_unique<CompiledStreamedSequence>(LoadCompiled(path));
  }
}

}  // namespace tav
