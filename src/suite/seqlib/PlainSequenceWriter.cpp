#include "suite/seqlib/PlainSequenceWriter.h"

#include <nlohmann/json.hpp>

#include "suite/seqlib/PlainSequence.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

using nlohmann::ordered_json;
constexpr const char* kSource = "PlainSequence.Write";
constexpr size_t kFlushBytes = 1 << 20;

ordered_json AddressJson(const ChannelAddress& a) {
  switch (a.family) {
    case kFamilyTAV:
      return {{"network", a.network}, {"unit", a.unit}, {"circuit", a.circuit}};
    case kFamilyX10:
      return {{"house", std::string(1, static_cast<char>('A' + a.network - 1))},
              {"unit", a.circuit}};
    case kFamilyFennick:
      return {{"network", a.network}, {"channel", a.circuit}};
    default:
      return {{"universe", a.network}, {"slot", a.circuit}};
  }
}

const char* FamilyKey(int32_t family) {
  switch (family) {
    case kFamilyTAV:
      return "tav";
    case kFamilyX10:
      return "x10";
    case kFamilyFennick:
      return "fennick";
    default:
      return "dmx";
  }
}

ordered_json ChannelsJson(const std::vector<SequenceChannel>& channels) {
  ordered_json list = ordered_json::array();
  for (const auto& channel : channels) {
    ordered_json c = ordered_json::object();
    if (!channel.name.empty()) c["name"] = channel.name;
    c[FamilyKey(channel.address.family)] = AddressJson(channel.address);
    ordered_json effects = ordered_json::array();
    for (const auto& e : channel.effects) {
      ordered_json j = {{"at", e.atMs}, {"type", EffectTypeName(e.type)}};
      if (e.durationMs != 0) j["duration"] = e.durationMs;
      if (e.type == kEffectSet) {
        j["level"] = e.endIntensity;
      } else if (e.type != kEffectOff) {
        j["from"] = e.startIntensity;
        j["to"] = e.endIntensity;
      }
      if (e.priority != 0) j["priority"] = e.priority;
      effects.push_back(std::move(j));
    }
    c["effects"] = std::move(effects);
    list.push_back(std::move(c));
  }
  return list;
}

ordered_json RunJson(const LevelTrack& track) {
  if (track.family == kFamilyTAV) {
    return {{"network", track.network},
            {"unit", track.unit},
            {"first_circuit", track.firstAddress},
            {"count", track.count}};
  }
  return {{"universe", track.network}, {"first_slot", track.firstAddress}, {"count", track.count}};
}

// `"key": value` at the document's first level, the value indented to match.
std::string Member(const char* key, const ordered_json& value) {
  std::string text = value.dump(1);
  std::string indented;
  indented.reserve(text.size() + text.size() / 8);
  for (char c : text) {
    indented += c;
    if (c == '\n') indented += ' ';
  }
  return std::string(" \"") + key + "\": " + indented;
}

void AppendHex(std::string& out, const uint8_t* p, size_t n) {
  static const char* digits = "0123456789abcdef";
  size_t at = out.size();
  out.resize(at + 2 * n);
  for (size_t i = 0; i < n; ++i) {
    out[at + 2 * i] = digits[p[i] >> 4];
    out[at + 2 * i + 1] = digits[p[i] & 15];
  }
}

}  // namespace

PlainSequenceWriter::PlainSequenceWriter(WritableFile& out, const SequenceData& head,
                                         std::vector<TrackGroup> groups)
    : m_out(out), m_groups(std::move(groups)) {
  for (const auto& group : m_groups) {
    if (group.tracks.empty() || group.stepMs <= 0) {
      throw seqerrors::InvalidFormat(kSource, "a frame track group without tracks or step");
    }
    for (const auto& track : group.tracks) {
      if (track.family != group.tracks[0].family ||
          (track.family != kFamilyDMX && track.family != kFamilyTAV)) {
        throw seqerrors::InvalidFormat(kSource,
                                       "frame tracks must be all DMX or all TAV in one group");
      }
    }
  }
  m_text = "{\n \"tessavar_sequence\": " + std::to_string(kPlainSequenceVersion);
  if (head.lengthMs > 0) m_text += ",\n \"length_ms\": " + std::to_string(head.lengthMs);
  if (!head.media.empty()) m_text += ",\n" + Member("media", head.media);
  if (!head.shellCommand.empty()) m_text += ",\n" + Member("shell_command", head.shellCommand);
  if (!head.channels.empty()) m_text += ",\n" + Member("channels", ChannelsJson(head.channels));
  if (!m_groups.empty()) m_text += ",\n \"frames\": [";
  ordered_json subs = ordered_json::array();
  for (const auto& s : head.subsequences)
    subs.push_back({{"file", s.file}, {"offset_ms", s.offsetMs}});
  if (!subs.empty()) m_subsequences = ",\n" + Member("subsequences", subs);
  OpenGroup();
}

void PlainSequenceWriter::OpenGroup() {
  if (m_group >= m_groups.size()) return;
  const TrackGroup& group = m_groups[m_group];
  const char* key = group.tracks[0].family == kFamilyTAV ? "tav" : "dmx";
  ordered_json runs;
  if (group.tracks.size() == 1) {
    runs = RunJson(group.tracks[0]);
  } else {
    runs = ordered_json::array();
    for (const auto& track : group.tracks) runs.push_back(RunJson(track));
  }
  m_text += m_group == 0 ? "\n  {\n" : ",\n  {\n";
  m_text += std::string("   \"") + key + "\": " + runs.dump() + ",\n";
  m_text += "   \"start_ms\": " + std::to_string(group.startMs) + ",\n";
  m_text += "   \"step_ms\": " + std::to_string(group.stepMs) + ",\n";
  m_text += "   \"levels\": [";
  m_groupOpen = true;
  m_frame = 0;
  if (group.frameCount == 0) CloseGroup();
}

void PlainSequenceWriter::CloseGroup() {
  m_text += m_frame == 0 ? "]\n  }" : "\n   ]\n  }";
  m_groupOpen = false;
  ++m_group;
  OpenGroup();
}

void PlainSequenceWriter::AddFrame(const uint8_t* levels) {
  if (!m_groupOpen) {
    throw seqerrors::InvalidFormat(kSource, "more frames than the track groups hold");
  }
  const TrackGroup& group = m_groups[m_group];
  m_text += m_frame == 0 ? "\n    \"" : ",\n    \"";
  AppendHex(m_text, levels, group.FrameBytes());
  m_text += '"';
  ++m_frame;
  if (m_frame == group.frameCount) CloseGroup();
  Flush(false);
}

void PlainSequenceWriter::Flush(bool always) {
  if (!always && m_text.size() < kFlushBytes) return;
  m_out.Append(m_text);
  m_text.clear();
}

void PlainSequenceWriter::Finish() {
  if (m_groupOpen) {
    throw seqerrors::InvalidFormat(kSource,
                                   "the sequence ended before the last frame of its frame tracks");
  }
  if (!m_groups.empty()) m_text += "\n ]";
  m_text += m_subsequences + "\n}\n";
  Flush(true);
}

void WritePlainSequence(StreamedSequence& source, WritableFile& out) {
  CompiledSequence head = source.Head();
  head.tracks.clear();
  PlainSequenceWriter writer(out, Decompile(head), source.Groups());
  while (const uint8_t* frame = source.NextFrame()) writer.AddFrame(frame);
  writer.Finish();
}

}  // namespace tav
