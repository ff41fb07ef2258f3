#include "suite/seqlib/FileSequenceLibrary.h"

#include <algorithm>
#include <map>
#include <set>

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
constexpr size_t kHashPiece = 1 << 20;

enum class Format { Plain, Fseq, Compressed };

// What a file is read for: to play it (an FSEQ file then plays from disk),
// to compile it (an FSEQ file is read whole into level tracks: for a
// subsequence or an export), or to load it as an export and nothing else.
enum class Purpose { kPlay, kCompile, kExportOnly };

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

// What one load gathers while it includes subsequences.
struct LoadContext {
  std::function<void()> keepAlive;
  // The files being included, the outermost first, to catch circles.
  std::vector<std::string> chain;
  // The content hash of every file read, by path.
  std::map<std::string, uint64_t> fileHashes;

  void KeepAlive() const {
    if (keepAlive) keepAlive();
  }
};

// The combined hash of a file and the files it included, each counted once.
uint64_t CombinedHash(uint64_t own, const std::vector<SubsequenceRef>& included,
                      const std::function<std::optional<uint64_t>(const std::string&)>& hashOf,
                      bool& complete) {
  std::vector<uint64_t> hashes;
  std::set<std::string> seen;
  complete = true;
  for (const auto& ref : included) {
    if (!seen.insert(ref.file).second) continue;
    std::optional<uint64_t> hash = hashOf(ref.file);
    if (!hash) {
      complete = false;
      return 0;
    }
    hashes.push_back(*hash);
  }
  return CombinedContentHash(own, hashes);
}

std::unique_ptr<FseqFile> OpenFseq(std::shared_ptr<const RandomAccessFile> file,
                                   std::shared_ptr<FseqBlockCache> cache) {
  auto fseq = std::make_unique<FseqFile>(std::move(file));
  fseq->SetBlockCache(std::move(cache));
  return fseq;
}

}  // namespace

struct FileSequenceLibrary::Core {
  std::shared_ptr<FileSystem> fileSystem;
  std::shared_ptr<const PathResolver> resolver;
  UniverseMap universes;
  std::shared_ptr<FseqBlockCache> fseqBlocks;

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

  // The one place that tells formats apart and decides what each becomes.
  std::shared_ptr<const SequenceContent> Read(const std::string& path, Purpose purpose,
                                              LoadContext& context) const {
    auto file = Open(path);
    Format format = Detect(*file);
    if (purpose == Purpose::kExportOnly && format != Format::Compressed) {
      throw seqerrors::InvalidFormat("SequenceLibrary.LoadCompressed",
                                     path + " is not a compressed sequence");
    }
    switch (format) {
      case Format::Compressed: {
        std::string bytes = fileSystem->ReadAll(path);
        context.fileHashes[path] = ContentHash(bytes);
        auto compiled = std::make_shared<CompiledSequence>(ReadCompressedSequence(bytes, path));
        return FromCompiled(compiled, "tcs", path, compiled->subsequences, [] { return true; });
      }
      case Format::Fseq:
        if (purpose == Purpose::kPlay) return PlayFseq(std::move(file), path);
        return FromCompiled(CompileFseq(std::move(file), path, context), "fseq", path, {},
                            [] { return true; });
      case Format::Plain:
      default:
        return ReadPlain(path, context);
    }
  }

  std::shared_ptr<const SequenceContent> PlayFseq(std::shared_ptr<const RandomAccessFile> file,
                                                  const std::string& path) const {
    FseqFile fseq(file);
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
    content->openStream = [file, map, cache = fseqBlocks] {
      return std::make_unique<FseqEventStream>(OpenFseq(file, cache), map);
    };
    // Nothing to gain from an export: FSEQ is already a compiled form.
    content->hasBeenExported = [] { return true; };
    return content;
  }

  std::shared_ptr<const CompiledSequence> CompileFseq(std::shared_ptr<const RandomAccessFile> file,
                                                      const std::string& path,
                                                      LoadContext& context) const {
    FseqFile fseq(std::move(file));
    auto compiled = std::make_shared<CompiledSequence>(
        Compile(FseqToSequenceData(fseq, universes, context.keepAlive),
                [](const SubsequenceRef&) { return nullptr; }));
    compiled->sourceHash = HashOfFile(path).value_or(0);
    context.fileHashes[path] = compiled->sourceHash;
    return compiled;
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

  // A plain sequence compiled with its subsequences merged in. Its compiled
  // form lists every file it included (nested ones too, where they were
  // found, at their offsets in this sequence) and records the combined hash
  // of all of them with its own; its info names the subsequences as the file
  // writes them.
  std::shared_ptr<const SequenceContent> ReadPlain(const std::string& path,
                                                   LoadContext& context) const {
    std::string text = fileSystem->ReadAll(path);
    uint64_t own = ContentHash(text);
    context.fileHashes[path] = own;
    context.KeepAlive();
    SequenceData data = ParsePlainSequence(text, path, context.keepAlive);
    context.KeepAlive();
    context.chain.push_back(path);
    std::vector<SubsequenceRef> included;
    auto loadSub = [&](const SubsequenceRef& ref) {
      std::string subPath = ResolveSubsequence(ref.file, path);
      if (std::find(context.chain.begin(), context.chain.end(), subPath) != context.chain.end()) {
        std::string chain;
        for (const auto& p : context.chain) chain += p + " includes ";
        throw seqerrors::InvalidFormat(kSource,
                                       "subsequences include each other: " + chain + subPath);
      }
      if (static_cast<int>(context.chain.size()) >= kMaxSubsequenceDepth) {
        throw seqerrors::InvalidFormat(kSource, path + ": subsequences nest deeper than " +
                                                    std::to_string(kMaxSubsequenceDepth) +
                                                    " levels");
      }
      auto sub = Read(subPath, Purpose::kCompile, context);
      included.push_back({subPath, ref.offsetMs});
      // An export included as a subsequence counts as one file: its bytes.
      if (sub->info.format == "plain") {
        for (const auto& nested : sub->compiled->subsequences) {
          included.push_back({nested.file, nested.offsetMs + ref.offsetMs});
        }
      }
      return sub->compiled;
    };
    auto compiled = std::make_shared<CompiledSequence>(Compile(data, loadSub));
    context.chain.pop_back();
    compiled->subsequences = included;
    bool complete = false;
    compiled->sourceHash = CombinedHash(
        own, included,
        [&context](const std::string& file) -> std::optional<uint64_t> {
          auto it = context.fileHashes.find(file);
          if (it == context.fileHashes.end()) return std::nullopt;
          return it->second;
        },
        complete);

    auto fs = fileSystem;
    uint64_t hash = compiled->sourceHash;
    std::string exportPath = path + "." + kCompressedExtension;
    return FromCompiled(compiled, "plain", path, data.subsequences, [fs, hash, exportPath] {
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

  std::shared_ptr<const SequenceContent> FromCompiled(
      std::shared_ptr<const CompiledSequence> compiled, const std::string& format,
      const std::string& path, std::vector<SubsequenceRef> subsequences,
      std::function<bool()> exported) const {
    auto content = std::make_shared<SequenceContent>();
    SequenceInfo& info = content->info;
    info.format = format;
    info.path = path;
    info.lengthMs = compiled->lengthMs;
    info.media = compiled->media;
    info.shellCommand = compiled->shellCommand;
    info.subsequences = std::move(subsequences);
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

  // The content hash of a file's bytes, read a piece at a time; nothing
  // when it cannot be read.
  std::optional<uint64_t> HashOfFile(const std::string& path) const {
    try {
      if (!fileSystem->Stat(path).IsFile()) return std::nullopt;
      auto file = fileSystem->OpenForRead(path);
      ContentHasher hasher;
      std::string piece(static_cast<size_t>(std::min<uint64_t>(file->Size(), kHashPiece)), '\0');
      for (uint64_t at = 0; at < file->Size();) {
        size_t n = file->ReadAt(at, piece.data(), piece.size());
        if (n == 0) return std::nullopt;  // shrank while being read
        hasher.Update(std::string_view(piece.data(), n));
        at += n;
      }
      return hasher.Value();
    } catch (const Error&) {
      return std::nullopt;
    }
  }
};

FileSequenceLibrary::FileSequenceLibrary(std::shared_ptr<const Clock> clock,
                                         std::shared_ptr<FileSystem> fileSystem,
                                         std::shared_ptr<const PathResolver> resolver,
                                         UniverseMap universes)
    : m_clock(std::move(clock)),
      m_core(std::make_shared<Core>(
          Core{std::move(fileSystem), std::move(resolver), std::move(universes), nullptr})) {
  if (!m_clock || !m_core->fileSystem) throw errors::ObjectNotSet("FileSequenceLibrary");
}

void FileSequenceLibrary::SetUniverseMap(const UniverseMap& universes) {
  // Sequences made earlier keep the core they were made with.
  m_core = std::make_shared<Core>(
      Core{m_core->fileSystem, m_core->resolver, universes, m_core->fseqBlocks});
}

void FileSequenceLibrary::SetFseqBlockCache(std::shared_ptr<FseqBlockCache> cache) {
  m_core = std::make_shared<Core>(
      Core{m_core->fileSystem, m_core->resolver, m_core->universes, std::move(cache)});
}

std::shared_ptr<Sequence> FileSequenceLibrary::CreateSequence() {
  std::shared_ptr<const Core> core = m_core;
  return std::make_shared<Sequence>(
      m_clock, [core](const std::string& path, const std::function<void()>& keepAlive) {
        LoadContext context{keepAlive, {}, {}};
        return core->Read(path, Purpose::kPlay, context);
      });
}

std::shared_ptr<Sequence> FileSequenceLibrary::LoadCompressed(const std::string& path) {
  auto sequence = CreateSequence();
  LoadContext context;
  sequence->Attach(m_core->Read(path, Purpose::kExportOnly, context));
  return sequence;
}

void FileSequenceLibrary::WriteCompressed(const Sequence& sequence, const std::string& path) {
  auto content = sequence.Content();
  if (!content) throw errors::ObjectNotSet("SequenceLibrary.WriteCompressed");
  std::function<void()> keepAlive = sequence.KeepAliveRaiser();
  auto compiled =
      content->compiled ? content->compiled : LoadCompiled(content->info.path, keepAlive);
  std::string bytes = WriteCompressedSequence(*compiled, 3, keepAlive);
  keepAlive();
  m_core->fileSystem->WriteAll(path, bytes, keepAlive);
}

std::optional<uint64_t> FileSequenceLibrary::CurrentSourceHash(
    const std::string& sequencePath, const std::vector<std::string>& includedFiles) {
  std::optional<uint64_t> own = m_core->HashOfFile(sequencePath);
  if (!own) return std::nullopt;
  std::vector<SubsequenceRef> included;
  for (const auto& file : includedFiles) included.push_back({file, 0});
  bool complete = false;
  uint64_t hash = CombinedHash(
      *own, included, [this](const std::string& file) { return m_core->HashOfFile(file); },
      complete);
  if (!complete) return std::nullopt;
  return hash;
}

std::shared_ptr<const SequenceContent> FileSequenceLibrary::LoadContent(
    const std::string& path, const std::function<void()>& keepAlive) const {
  LoadContext context{keepAlive, {}, {}};
  return m_core->Read(path, Purpose::kPlay, context);
}

std::shared_ptr<const CompiledSequence> FileSequenceLibrary::LoadCompiled(
    const std::string& path, const std::function<void()>& keepAlive) const {
  LoadContext context{keepAlive, {}, {}};
  return m_core->Read(path, Purpose::kCompile, context)->compiled;
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
      return std::make_unique<FseqStreamedSequence>(OpenFseq(file, m_core->fseqBlocks),
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
