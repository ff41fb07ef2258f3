#include "suite/seqlib/PlainSequence.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstring>

#include "suite/seqlib/PlainSequenceWriter.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SeqErrors.h"

namespace tav {

namespace {

using nlohmann::json;
constexpr const char* kSource = "PlainSequence.Parse";

// Walks the document with the JSON path of the value at hand, so every
// complaint says where it is.
class Walker {
 public:
  Walker(const std::string& name) : m_name(name) {}

  [[noreturn]] void Fail(const std::string& path, const std::string& message) const {
    throw seqerrors::InvalidFormat(kSource,
                                   m_name + ": " + (path.empty() ? "" : path + ": ") + message);
  }

  const json& Member(const json& object, const std::string& path, const char* key) const {
    auto it = object.find(key);
    if (it == object.end()) Fail(path, std::string("missing \"") + key + "\"");
    return *it;
  }

  const json* Optional(const json& object, const char* key) const {
    auto it = object.find(key);
    return it == object.end() ? nullptr : &*it;
  }

  int64_t Integer(const json& value, const std::string& path, int64_t low, int64_t high) const {
    int64_t number = 0;
    if (value.is_number_integer()) {
      if (value.is_number_unsigned() && value.get<uint64_t>() > static_cast<uint64_t>(INT64_MAX)) {
        Fail(path, "number is too large");
      }
      number = value.get<int64_t>();
    } else if (value.is_number_float() && std::abs(value.get<double>()) < 9.0e15 &&
               value.get<double>() == std::trunc(value.get<double>())) {
      number = static_cast<int64_t>(value.get<double>());
    } else {
      Fail(path, "expected a whole number, found " + Describe(value));
    }
    if (number < low || number > high) {
      Fail(path, std::to_string(number) + " is outside " + std::to_string(low) + "-" +
                     std::to_string(high));
    }
    return number;
  }

  int64_t IntegerMember(const json& object, const std::string& path, const char* key, int64_t low,
                        int64_t high) const {
    return Integer(Member(object, path, key), path + "." + key, low, high);
  }

  int64_t IntegerOr(const json& object, const std::string& path, const char* key, int64_t low,
                    int64_t high, int64_t fallback) const {
    const json* value = Optional(object, key);
    return value ? Integer(*value, path + "." + key, low, high) : fallback;
  }

  std::string Text(const json& value, const std::string& path) const {
    if (!value.is_string()) Fail(path, "expected a text, found " + Describe(value));
    return value.get<std::string>();
  }

  std::string TextOr(const json& object, const std::string& path, const char* key) const {
    const json* value = Optional(object, key);
    return value ? Text(*value, path + "." + key) : std::string();
  }

  const json& ObjectAt(const json& value, const std::string& path) const {
    if (!value.is_object()) Fail(path, "expected an object, found " + Describe(value));
    return value;
  }

  const json& ArrayAt(const json& value, const std::string& path) const {
    if (!value.is_array()) Fail(path, "expected a list, found " + Describe(value));
    return value;
  }

  static std::string Describe(const json& value) {
    switch (value.type()) {
      case json::value_t::null:
        return "null";
      case json::value_t::boolean:
        return "true/false";
      case json::value_t::string:
        return "a text";
      case json::value_t::array:
        return "a list";
      case json::value_t::object:
        return "an object";
      case json::value_t::number_float:
        return "a fraction";
      default:
        return "a number";
    }
  }

 private:
  const std::string& m_name;
};

constexpr int64_t kMaxTime = int64_t{1} << 40;  // about 35 years of milliseconds
constexpr int64_t kMaxInt = INT32_MAX;

// The address of a channel: exactly one of the family keys.
ChannelAddress ReadAddress(const Walker& w, const json& channel, const std::string& path) {
  ChannelAddress a;
  int found = 0;
  if (const json* v = w.Optional(channel, "tav")) {
    std::string p = path + ".tav";
    w.ObjectAt(*v, p);
    a = {kFamilyTAV, static_cast<int32_t>(w.IntegerMember(*v, p, "network", 1, kMaxInt)),
         static_cast<int32_t>(w.IntegerMember(*v, p, "unit", 0, 255)),
         static_cast<int32_t>(w.IntegerMember(*v, p, "circuit", 1, kMaxInt))};
    ++found;
  }
  if (const json* v = w.Optional(channel, "x10")) {
    std::string p = path + ".x10";
    w.ObjectAt(*v, p);
    const json& house = w.Member(*v, p, "house");
    int32_t code = 0;
    if (house.is_string()) {
      std::string text = house.get<std::string>();
      if (text.size() != 1 || std::toupper(static_cast<unsigned char>(text[0])) < 'A' ||
          std::toupper(static_cast<unsigned char>(text[0])) > 'P') {
        w.Fail(p + ".house", "house code \"" + text + "\" is not a letter A-P");
      }
      code = std::toupper(static_cast<unsigned char>(text[0])) - 'A' + 1;
    } else {
      code = static_cast<int32_t>(w.Integer(house, p + ".house", 1, 16));
    }
    a = {kFamilyX10, code, 0, static_cast<int32_t>(w.IntegerMember(*v, p, "unit", 1, 16))};
    ++found;
  }
  if (const json* v = w.Optional(channel, "fennick")) {
    std::string p = path + ".fennick";
    w.ObjectAt(*v, p);
    a = {kFamilyFennick, static_cast<int32_t>(w.IntegerMember(*v, p, "network", 1, kMaxInt)), 0,
         static_cast<int32_t>(w.IntegerMember(*v, p, "channel", 1, kMaxInt))};
    ++found;
  }
  if (const json* v = w.Optional(channel, "dmx")) {
    std::string p = path + ".dmx";
    w.ObjectAt(*v, p);
    a = {kFamilyDMX, static_cast<int32_t>(w.IntegerMember(*v, p, "universe", 1, 63999)), 0,
         static_cast<int32_t>(w.IntegerMember(*v, p, "slot", 1, 512))};
    ++found;
  }
  if (found != 1) {
    w.Fail(
        path,
        found == 0
            ? "no address: give one of \"tav\", \"x10\", \"fennick\" or \"dmx\""
            : "more than one address: give only one of \"tav\", \"x10\", \"fennick\" or \"dmx\"");
  }
  return a;
}

Effect ReadEffect(const Walker& w, const json& e, const std::string& path) {
  w.ObjectAt(e, path);
  Effect effect;
  effect.atMs = w.IntegerMember(e, path, "at", 0, kMaxTime);
  std::string typeName = w.Text(w.Member(e, path, "type"), path + ".type");
  effect.type = EffectTypeFromName(typeName);
  if (effect.type < 0) {
    w.Fail(path + ".type",
           "unknown effect \"" + typeName + "\" (expected set, fade, twinkle, shimmer or off)");
  }
  effect.durationMs = static_cast<int32_t>(w.IntegerOr(e, path, "duration", 0, kMaxInt, 0));
  effect.priority = static_cast<int32_t>(w.IntegerOr(e, path, "priority", -kMaxInt, kMaxInt, 0));
  switch (effect.type) {
    case kEffectSet:
      effect.startIntensity = effect.endIntensity =
          static_cast<int32_t>(w.IntegerMember(e, path, "level", 0, 100));
      break;
    case kEffectFade:
      effect.startIntensity = static_cast<int32_t>(w.IntegerMember(e, path, "from", 0, 100));
      effect.endIntensity = static_cast<int32_t>(w.IntegerMember(e, path, "to", 0, 100));
      break;
    case kEffectTwinkle:
    case kEffectShimmer:
      effect.startIntensity = static_cast<int32_t>(w.IntegerOr(e, path, "from", 0, 100, 0));
      effect.endIntensity = static_cast<int32_t>(w.IntegerOr(e, path, "to", 0, 100, 100));
      break;
    default:
      break;
  }
  return effect;
}

uint8_t HexDigit(const Walker& w, char c, const std::string& path) {
  if (c >= '0' && c <= '9') return static_cast<uint8_t>(c - '0');
  if (c >= 'a' && c <= 'f') return static_cast<uint8_t>(c - 'a' + 10);
  if (c >= 'A' && c <= 'F') return static_cast<uint8_t>(c - 'A' + 10);
  w.Fail(path, std::string("'") + c + "' is not a hexadecimal digit");
}

// One run of addresses: the "dmx" or "tav" object of a frame entry.
LevelTrack ReadTrackAddress(const Walker& w, const json& a, int32_t family, const std::string& p) {
  w.ObjectAt(a, p);
  LevelTrack track;
  track.family = family;
  if (family == kFamilyDMX) {
    track.network = static_cast<int32_t>(w.IntegerMember(a, p, "universe", 1, 63999));
    track.firstAddress = static_cast<int32_t>(w.IntegerMember(a, p, "first_slot", 1, 512));
    track.count = static_cast<int32_t>(w.IntegerMember(a, p, "count", 1, 512));
    if (track.firstAddress + track.count - 1 > 512) {
      w.Fail(p, "slots " + std::to_string(track.firstAddress) + " to " +
                    std::to_string(track.firstAddress + track.count - 1) + " run past slot 512");
    }
  } else {
    track.network = static_cast<int32_t>(w.IntegerMember(a, p, "network", 1, kMaxInt));
    track.unit = static_cast<int32_t>(w.IntegerMember(a, p, "unit", 0, 255));
    track.firstAddress = static_cast<int32_t>(w.IntegerMember(a, p, "first_circuit", 1, kMaxInt));
    track.count = static_cast<int32_t>(w.IntegerMember(a, p, "count", 1, 4096));
  }
  return track;
}

// A frame entry: one run of addresses, or a list of runs whose levels lie
// back to back in every frame (as a converter writes many universes that
// share their frames). Gives one track per run.
std::vector<LevelTrack> ReadTracks(const Walker& w, const json& t, const std::string& path) {
  w.ObjectAt(t, path);
  const json* dmx = w.Optional(t, "dmx");
  const json* tav = w.Optional(t, "tav");
  if ((dmx != nullptr) == (tav != nullptr)) w.Fail(path, "give exactly one of \"dmx\" or \"tav\"");
  int32_t family = dmx ? kFamilyDMX : kFamilyTAV;
  const json& runs = dmx ? *dmx : *tav;
  std::string p = path + (dmx ? ".dmx" : ".tav");
  std::vector<LevelTrack> tracks;
  if (runs.is_array()) {
    if (runs.empty()) w.Fail(p, "empty list of address runs");
    for (size_t i = 0; i < runs.size(); ++i) {
      tracks.push_back(ReadTrackAddress(w, runs[i], family, p + "[" + std::to_string(i) + "]"));
    }
  } else {
    tracks.push_back(ReadTrackAddress(w, runs, family, p));
  }
  int64_t startMs = w.IntegerOr(t, path, "start_ms", 0, kMaxTime, 0);
  auto stepMs = static_cast<int32_t>(w.IntegerMember(t, path, "step_ms", 1, 60000));
  size_t total = 0;
  for (auto& track : tracks) {
    track.startMs = startMs;
    track.stepMs = stepMs;
    total += static_cast<size_t>(track.count);
  }
  const json& levels = w.ArrayAt(w.Member(t, path, "levels"), path + ".levels");
  for (auto& track : tracks) track.levels.reserve(levels.size() * static_cast<size_t>(track.count));
  std::vector<uint8_t> frame(total);
  for (size_t k = 0; k < levels.size(); ++k) {
    std::string lp = path + ".levels[" + std::to_string(k) + "]";
    const json& entry = levels[k];
    if (entry.is_string()) {
      const std::string& hex = entry.get_ref<const std::string&>();
      if (hex.size() != total * 2) {
        w.Fail(lp, "holds " + std::to_string(hex.size()) + " hexadecimal digits, " +
                       std::to_string(total * 2) + " expected (two per level)");
      }
      for (size_t i = 0; i < total; ++i) {
        frame[i] = static_cast<uint8_t>(HexDigit(w, hex[2 * i], lp) << 4 |
                                        HexDigit(w, hex[2 * i + 1], lp));
      }
    } else if (entry.is_array()) {
      if (entry.size() != total) {
        w.Fail(lp, "holds " + std::to_string(entry.size()) + " levels, " + std::to_string(total) +
                       " expected");
      }
      for (size_t i = 0; i < total; ++i) {
        frame[i] =
            static_cast<uint8_t>(w.Integer(entry[i], lp + "[" + std::to_string(i) + "]", 0, 255));
      }
    } else {
      w.Fail(lp,
             "expected a hexadecimal text or a list of levels, found " + Walker::Describe(entry));
    }
    const uint8_t* from = frame.data();
    for (auto& track : tracks) {
      track.levels.insert(track.levels.end(), from, from + track.count);
      from += track.count;
    }
  }
  return tracks;
}

std::string PositionOf(std::string_view text, size_t byte) {
  size_t line = 1, column = 1;
  for (size_t i = 0; i < byte && i < text.size(); ++i) {
    if (text[i] == '\n') {
      ++line;
      column = 1;
    } else {
      ++column;
    }
  }
  return "line " + std::to_string(line) + ", column " + std::to_string(column);
}

}  // namespace

bool LooksLikePlainSequence(std::string_view text) {
  size_t i = 0;
  if (text.substr(0, 3) == "\xEF\xBB\xBF") i = 3;
  while (i < text.size() && std::isspace(static_cast<unsigned char>(text[i]))) ++i;
  return i < text.size() && text[i] == '{';
}

SequenceData ParsePlainSequence(std::string_view text, const std::string& name,
                                const std::function<void()>& progress) {
  Walker w(name);
  if (text.substr(0, 3) == "\xEF\xBB\xBF") text.remove_prefix(3);
  json doc;
  try {
    if (progress) {
      size_t events = 0;
      doc = json::parse(text.begin(), text.end(), [&](int, json::parse_event_t, json&) {
        if (++events % 16384 == 0) progress();
        return true;
      });
    } else {
      doc = json::parse(text.begin(), text.end());
    }
  } catch (const json::parse_error& e) {
    std::string what = e.what();
    auto colon = what.rfind(": ");
    w.Fail("", "not valid JSON at " + PositionOf(text, e.byte > 0 ? e.byte - 1 : 0) +
                   (colon == std::string::npos ? "" : " (" + what.substr(colon + 2) + ")"));
  } catch (const json::exception& e) {
    // Numbers too large for any type end the parse this way.
    std::string what = e.what();
    auto bracket = what.find("] ");
    w.Fail("", "not valid JSON (" +
                   (bracket == std::string::npos ? what : what.substr(bracket + 2)) + ")");
  }
  w.ObjectAt(doc, "the document");
  const json* version = w.Optional(doc, "tessavar_sequence");
  if (!version) w.Fail("", "not a plain sequence (no \"tessavar_sequence\" version)");
  int64_t v = w.Integer(*version, "tessavar_sequence", 1, 1000000);
  if (v > kPlainSequenceVersion) {
    w.Fail("tessavar_sequence", "version " + std::to_string(v) +
                                    " is newer than this program reads (" +
                                    std::to_string(kPlainSequenceVersion) + ")");
  }

  SequenceData data;
  data.lengthMs = w.IntegerOr(doc, "", "length_ms", 0, kMaxTime, 0);
  data.media = w.TextOr(doc, "", "media");
  data.shellCommand = w.TextOr(doc, "", "shell_command");
  if (const json* channels = w.Optional(doc, "channels")) {
    w.ArrayAt(*channels, "channels");
    data.channels.reserve(channels->size());
    for (size_t i = 0; i < channels->size(); ++i) {
      std::string path = "channels[" + std::to_string(i) + "]";
      const json& c = w.ObjectAt((*channels)[i], path);
      SequenceChannel channel;
      channel.name = w.TextOr(c, path, "name");
      channel.address = ReadAddress(w, c, path);
      if (const json* effects = w.Optional(c, "effects")) {
        w.ArrayAt(*effects, path + ".effects");
        channel.effects.reserve(effects->size());
        for (size_t k = 0; k < effects->size(); ++k) {
          channel.effects.push_back(
              ReadEffect(w, (*effects)[k], path + ".effects[" + std::to_string(k) + "]"));
        }
      }
      data.channels.push_back(std::move(channel));
    }
  }
  if (const json* frames = w.Optional(doc, "frames")) {
    w.ArrayAt(*frames, "frames");
    for (size_t i = 0; i < frames->size(); ++i) {
      for (auto& track : ReadTracks(w, (*frames)[i], "frames[" + std::to_string(i) + "]")) {
        data.tracks.push_back(std::move(track));
      }
    }
  }
  if (const json* subs = w.Optional(doc, "subsequences")) {
    w.ArrayAt(*subs, "subsequences");
    for (size_t i = 0; i < subs->size(); ++i) {
      std::string path = "subsequences[" + std::to_string(i) + "]";
      const json& s = w.ObjectAt((*subs)[i], path);
      SubsequenceRef ref;
      ref.file = w.Text(w.Member(s, path, "file"), path + ".file");
      if (ref.file.empty()) w.Fail(path + ".file", "empty file name");
      ref.offsetMs = w.IntegerOr(s, path, "offset_ms", 0, kMaxTime, 0);
      data.subsequences.push_back(std::move(ref));
    }
  }
  return data;
}

std::string WritePlainSequence(const SequenceData& data) {
  MemoryWritableFile out;
  SequenceData head = data;
  head.tracks.clear();
  PlainSequenceWriter writer(out, head, GroupTracks(data.tracks));
  std::vector<uint8_t> frame;
  size_t first = 0;
  for (const auto& group : writer.Groups()) {
    frame.resize(group.FrameBytes());
    for (uint32_t k = 0; k < group.frameCount; ++k) {
      uint8_t* to = frame.data();
      for (size_t t = 0; t < group.tracks.size(); ++t) {
        const LevelTrack& track = data.tracks[first + t];
        size_t count = static_cast<size_t>(track.count);
        std::memcpy(to, track.levels.data() + k * count, count);
        to += count;
      }
      writer.AddFrame(frame.data());
    }
    first += group.tracks.size();
  }
  writer.Finish();
  return std::move(out.Bytes());
}

}  // namespace tav
