#include "suite/seqlib/testing/MemorySequenceLibrary.h"

#include "suite/seqlib/CompiledEventStream.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {

struct MemorySequenceLibrary::State {
  struct Entry {
    std::shared_ptr<const CompiledSequence> compiled;
    std::shared_ptr<bool> exported;
  };
  std::map<std::string, Entry> plain;
  std::map<std::string, Entry> compressed;
  std::vector<std::string> loads;
  std::set<std::string> failing;

  static std::shared_ptr<const SequenceContent> Content(const Entry& entry,
                                                        const std::string& format,
                                                        const std::string& path) {
    auto content = std::make_shared<SequenceContent>();
    const auto& c = entry.compiled;
    content->info.format = format;
    content->info.path = path;
    content->info.lengthMs = c->lengthMs;
    content->info.media = c->media;
    content->info.shellCommand = c->shellCommand;
    content->info.subsequences = c->subsequences;
    for (int32_t family : {kFamilyTAV, kFamilyX10, kFamilyFennick, kFamilyDMX}) {
      if (c->UsesFamily(family)) content->info.families.push_back(family);
    }
    content->info.channelCount = c->channels.size();
    content->info.effectCount = c->effects.size();
    content->info.frameCount = c->TimelineFrameCount();
    content->info.levelBlockCount = c->LevelBlockCount();
    content->compiled = c;
    content->openStream = [c] { return std::make_unique<CompiledEventStream>(c); };
    auto exported = entry.exported;
    content->hasBeenExported = [exported] { return *exported; };
    return content;
  }
};

namespace {
std::shared_ptr<const CompiledSequence> CompileAlone(SequenceData data) {
  return std::make_shared<CompiledSequence>(
      Compile(data, [](const SubsequenceRef&) { return nullptr; }));
}
}  // namespace

MemorySequenceLibrary::MemorySequenceLibrary(std::shared_ptr<const Clock> clock)
    : m_clock(std::move(clock)),
      m_state(std::make_shared<State>()),
      m_loads(m_state->loads),
      m_failing(m_state->failing) {}

void MemorySequenceLibrary::AddSequence(const std::string& path, SequenceData data, bool exported) {
  m_state->plain[path] = {CompileAlone(std::move(data)), std::make_shared<bool>(exported)};
}

void MemorySequenceLibrary::AddCompressed(const std::string& path, SequenceData data) {
  m_state->compressed[path] = {CompileAlone(std::move(data)), std::make_shared<bool>(true)};
}

std::shared_ptr<Sequence> MemorySequenceLibrary::CreateSequence() {
  std::shared_ptr<State> state = m_state;
  return std::make_shared<Sequence>(
      m_clock, [state](const std::string& path, const std::function<void()>& keepAlive) {
        state->loads.push_back(path);
        if (keepAlive) keepAlive();
        auto it = state->plain.find(path);
        if (state->failing.count(path))
          throw seqerrors::InvalidFormat("SequenceLibrary.Load", path + ": made to fail");
        if (it == state->plain.end()) throw seqerrors::FileNotFound("SequenceLibrary.Load", path);
        return State::Content(it->second, "plain", path);
      });
}

std::shared_ptr<Sequence> MemorySequenceLibrary::LoadCompressed(const std::string& path) {
  m_compressedLoads.push_back(path);
  if (m_failing.count(path))
    throw seqerrors::InvalidFormat("SequenceLibrary.LoadCompressed", path + ": made to fail");
  auto it = m_state->compressed.find(path);
  if (it == m_state->compressed.end())
    throw seqerrors::FileNotFound("SequenceLibrary.LoadCompressed", path);
  auto sequence = std::make_shared<Sequence>(m_clock, nullptr);
  sequence->Attach(State::Content(it->second, "tcs", path));
  return sequence;
}

void MemorySequenceLibrary::WriteCompressed(const Sequence& sequence, const std::string& path) {
  m_writes.push_back(path);
  if (m_failWrites)
    throw seqerrors::FileAccess("SequenceLibrary.WriteCompressed", path + ": made to fail");
  auto content = sequence.Content();
  if (!content || !content->compiled) throw errors::ObjectNotSet("SequenceLibrary.WriteCompressed");
  m_state->compressed[path] = {content->compiled, std::make_shared<bool>(true)};
  auto it = m_state->plain.find(content->info.path);
  if (it != m_state->plain.end()) *it->second.exported = true;
}

std::optional<uint64_t> MemorySequenceLibrary::CurrentSourceHash(const std::string& sequencePath,
                                                                 const std::vector<std::string>&) {
  auto it = m_state->plain.find(sequencePath);
  if (it == m_state->plain.end()) return std::nullopt;
  return it->second.compiled->sourceHash;
}

}  // namespace tav
