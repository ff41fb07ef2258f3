// showctl sequence levels: what a sequence gives at one moment, to check a
// converted file or a controller's wiring. The moment is reached as the
// player reaches it when it starts (or jumps) there: the sequence player
// runs on a clock that stands still, seeks to the moment and hands out what
// is due then. Effects show as the player resumes them (a fade at the level
// it has reached); frame tracks show the frame on show. Only one frame per
// track is read, so a long file costs no more than a short one.

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include <charconv>
#include <iostream>
#include <map>
#include <tuple>

#include "CommandRegistry.h"
#include "SequenceCommands.h"
#include "ports/ManualClock.h"
#include "suite/seqlib/CompiledEventStream.h"
#include "suite/seqlib/PlayEvent.h"
#include "suite/seqlib/SequencePlayer.h"

namespace tav::showctl {
namespace {

constexpr int32_t kSlotsPerUniverse = 512;

// Digits only, as a whole number.
std::optional<int64_t> Whole(std::string_view text) {
  int64_t value = 0;
  if (text.empty() || text.size() > 15) return std::nullopt;
  auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
  if (error != std::errc() || end != text.data() + text.size() || value < 0) return std::nullopt;
  return value;
}

// Seconds with an optional fraction: "5", "5.25", "05.250".
std::optional<int64_t> SecondsAsMs(std::string_view text) {
  auto dot = text.find('.');
  auto whole = Whole(text.substr(0, dot));
  if (!whole) return std::nullopt;
  int64_t ms = *whole * 1000;
  if (dot != std::string_view::npos) {
    std::string_view fraction = text.substr(dot + 1);
    if (fraction.empty() || !Whole(fraction)) return std::nullopt;
    int64_t scale = 100;
    for (size_t i = 0; i < fraction.size() && i < 3; ++i, scale /= 10) {
      ms += (fraction[i] - '0') * scale;
    }
  }
  return ms;
}

// "90", "90.5", "1:30", "1:30.250", "1:02:03.5", "1500ms".
std::optional<int64_t> ParseTime(const std::string& text) {
  std::string_view rest = text;
  if (rest.size() > 2 && rest.substr(rest.size() - 2) == "ms") {
    return Whole(rest.substr(0, rest.size() - 2));
  }
  std::vector<std::string_view> parts;
  for (auto colon = rest.find(':'); colon != std::string_view::npos; colon = rest.find(':')) {
    parts.push_back(rest.substr(0, colon));
    rest = rest.substr(colon + 1);
  }
  parts.push_back(rest);
  auto ms = SecondsAsMs(parts.back());
  if (parts.size() > 3 || !ms || (parts.size() > 1 && *ms >= 60000)) return std::nullopt;
  // Minutes below hours are 0-59; the leading field may be any size.
  int64_t unit = 60000;
  for (size_t i = parts.size() - 1; i-- > 0; unit *= 60) {
    auto value = Whole(parts[i]);
    if (!value || (i > 0 && *value >= 60)) return std::nullopt;
    *ms += *value * unit;
  }
  return ms;
}

struct ChannelRange {
  int64_t first;
  int64_t last;
};

// "1-512", "42", "1-10,600-700": absolute DMX channels from 1.
std::optional<std::vector<ChannelRange>> ParseRanges(const std::string& text) {
  std::vector<ChannelRange> ranges;
  std::string_view rest = text;
  while (true) {
    auto comma = rest.find(',');
    std::string_view item = rest.substr(0, comma);
    auto dash = item.find('-');
    auto first = Whole(item.substr(0, dash));
    auto last = dash == std::string_view::npos ? first : Whole(item.substr(dash + 1));
    if (!first || !last || *first < 1 || *last < *first) return std::nullopt;
    ranges.push_back({*first, *last});
    if (comma == std::string_view::npos) break;
    rest = rest.substr(comma + 1);
  }
  return ranges;
}

// Which DMX slots the command shows; everything when neither option is set.
struct Filter {
  std::optional<int32_t> universe;
  std::vector<ChannelRange> ranges;

  bool Any() const { return universe || !ranges.empty(); }
  bool Dmx(int32_t universeNumber, int32_t slot) const {
    if (universe) return universeNumber == *universe;
    if (ranges.empty()) return true;
    int64_t channel = static_cast<int64_t>(universeNumber - 1) * kSlotsPerUniverse + slot;
    return std::any_of(ranges.begin(), ranges.end(), [&](const ChannelRange& r) {
      return channel >= r.first && channel <= r.last;
    });
  }
  bool Address(int32_t family, int32_t network, int32_t address) const {
    return family == kFamilyDMX ? Dmx(network, address) : !Any();
  }
  std::string Describe() const {
    if (universe) return fmt::format("DMX universe {}", *universe);
    std::string text;
    for (const auto& r : ranges) {
      text += (text.empty() ? "" : ",") +
              (r.first == r.last ? std::to_string(r.first) : fmt::format("{}-{}", r.first, r.last));
    }
    return "DMX channels " + text;
  }
};

int64_t AbsoluteChannel(int32_t universe, int32_t slot) {
  return static_cast<int64_t>(universe - 1) * kSlotsPerUniverse + slot;
}

std::string AddressText(const ChannelAddress& a) {
  switch (a.family) {
    case kFamilyTAV:
      return fmt::format("TAV {}/{}/{}", a.network, a.unit, a.circuit);
    case kFamilyX10:
      return fmt::format("X10 {}{}", static_cast<char>('A' + a.network - 1), a.circuit);
    case kFamilyFennick:
      return fmt::format("Fennick {}/{}", a.network, a.circuit);
    case kFamilyDMX:
      return fmt::format("DMX {}/{} (ch {})", a.network, a.circuit,
                         AbsoluteChannel(a.network, a.circuit));
    default:
      return fmt::format("{} {}/{}/{}", FamilyName(a.family), a.network, a.unit, a.circuit);
  }
}

// One effect channel and the effect the player gives it at the moment.
struct EffectState {
  ChannelAddress address;
  std::string name;
  bool on = false;
  int32_t type = 0;
  int32_t level = 0;  // where it stands: the start of what is left
  int32_t to = 0;
  int32_t remainingMs = 0;
};

std::string StateText(const EffectState& e) {
  if (!e.on) return "-        (no effect under way)";
  switch (e.type) {
    case kEffectOff:
      return "off        0%";
    case kEffectSet:
      return fmt::format("set      {:>3}%", e.level);
    case kEffectFade:
      return e.remainingMs > 0
                 ? fmt::format("fade     {:>3}%  to {}% in {} ms", e.level, e.to, e.remainingMs)
                 : fmt::format("fade     {:>3}%", e.level);
    default:
      return fmt::format("{:<8} {}-{}%, {} ms left", EffectTypeName(e.type), e.level, e.to,
                         e.remainingMs);
  }
}

// Levels of one family's network (and unit): address -> level.
using LevelKey = std::tuple<int32_t, int32_t, int32_t>;  // family, network, unit
using LevelMap = std::map<LevelKey, std::map<int32_t, uint8_t>>;

struct Run {
  LevelKey key;
  int32_t first;
  std::vector<uint8_t> levels;
};

std::vector<Run> Runs(const LevelMap& levels) {
  std::vector<Run> runs;
  for (const auto& [key, slots] : levels) {
    for (const auto& [address, level] : slots) {
      if (runs.empty() || runs.back().key != key ||
          runs.back().first + static_cast<int32_t>(runs.back().levels.size()) != address) {
        runs.push_back({key, address, {}});
      }
      runs.back().levels.push_back(level);
    }
  }
  return runs;
}

std::string RunTitle(const Run& run) {
  auto [family, network, unit] = run.key;
  int32_t last = run.first + static_cast<int32_t>(run.levels.size()) - 1;
  if (family == kFamilyDMX) {
    return fmt::format("DMX universe {}, slots {}-{} (channels {}-{})", network, run.first, last,
                       AbsoluteChannel(network, run.first), AbsoluteChannel(network, last));
  }
  return fmt::format("{} network {} unit {}, circuits {}-{}", FamilyName(family), network, unit,
                     run.first, last);
}

struct Moment {
  int64_t ms = 0;
  int64_t frame = -1;  // of the timeline, when one is on show
  size_t frames = 0;
};

Moment ChooseMoment(const SequenceOptions& o, const StreamedSequence& stream,
                    const std::string& file) {
  Moment m;
  m.frames = TimelineFrameCount(stream.Groups());
  int64_t length = stream.Head().lengthMs;
  if (o.frame) {
    int64_t due = *o.frame < 0 ? -1 : TimelineFrameTime(stream.Groups(), *o.frame);
    if (due < 0) {
      throw CommandFailed(
          m.frames == 0 ? fmt::format("{} has no frames; give --at instead", file)
                        : fmt::format("--frame {} is not a frame of {}: it has frames 0 to {}",
                                      *o.frame, file, m.frames - 1));
    }
    m.ms = due;
  } else if (!o.at.empty()) {
    auto ms = ParseTime(o.at);
    if (!ms) {
      throw CommandFailed(
          fmt::format("--at \"{}\" is not a time: give seconds (90 or 90.5), minutes and seconds "
                      "(1:30 or 1:30.250), hours too (1:02:03.5), or milliseconds (1500ms)",
                      o.at));
    }
    if (*ms >= std::max<int64_t>(length, 1)) {
      throw CommandFailed(fmt::format("--at {} is past the end of {}, which is {} long",
                                      ClockTime(*ms), file, ClockTime(length)));
    }
    m.ms = *ms;
  }
  if (m.ms > INT32_MAX) throw CommandFailed("the moment lies too far into the sequence");
  // The frame of the timeline, while one is on show.
  uint32_t onShow = 0;
  bool any = std::any_of(stream.Groups().begin(), stream.Groups().end(),
                         [&](const TrackGroup& g) { return g.FrameAt(m.ms, onShow); });
  m.frame = any ? TimelineFrameAt(stream.Groups(), m.ms) : -1;
  return m;
}

// What the player hands out when it starts at `ms`: effects as resumed there
// and the frame on show of every track.
std::vector<PlayEvent> EventsAt(CompiledSequence reduced, int64_t ms) {
  int64_t length = reduced.lengthMs;
  auto clock = std::make_shared<ManualClock>();
  SequencePlayer player(
      clock,
      std::make_unique<CompiledEventStream>(std::make_shared<CompiledSequence>(std::move(reduced))),
      length);
  player.SetLookaheadMs(0);
  player.InitializeForPlay(false);
  // Following "music" that stands at `ms` is how the player starts part way.
  player.InitMusicSync(static_cast<int32_t>(ms));
  player.StartPlay();
  std::vector<PlayEvent> events;
  PlayEvent event;
  while (player.GetEvent(event)) events.push_back(event);
  return events;
}

void PrintTable(const std::string& file, const Moment& m, const std::vector<EffectState>& effects,
                const std::vector<Run>& runs) {
  std::cout << file << " at " << Duration(m.ms);
  if (m.frame >= 0) std::cout << ", frame " << m.frame << " of " << m.frames;
  std::cout << "\n";
  if (!effects.empty()) {
    std::cout << "\nEffect channels (percent):\n";
    for (const auto& e : effects) {
      std::cout << fmt::format("  {:<22} {:<20} {}\n", AddressText(e.address), e.name,
                               StateText(e));
    }
  }
  if (!runs.empty()) std::cout << "\nFrame levels (0-255):\n";
  for (const auto& run : runs) {
    std::cout << "  " << RunTitle(run) << "\n";
    for (size_t i = 0; i < run.levels.size(); i += 16) {
      std::cout << fmt::format("    {:>5}:", run.first + static_cast<int32_t>(i));
      for (size_t k = i; k < run.levels.size() && k < i + 16; ++k) {
        std::cout << fmt::format(" {:>3}", run.levels[k]);
      }
      std::cout << "\n";
    }
  }
  if (effects.empty() && runs.empty()) std::cout << "\nNothing is on show at this moment.\n";
}

// One member per line and one list entry per line, each compact: readable,
// and a universe of levels stays one line.
std::string JsonLines(const nlohmann::ordered_json& doc) {
  std::string text = "{";
  const char* comma = "\n";
  for (const auto& [key, value] : doc.items()) {
    text += comma + std::string(" ") + nlohmann::ordered_json(key).dump() + ": ";
    if (value.is_array() && !value.empty()) {
      text += "[";
      const char* inner = "\n";
      for (const auto& entry : value)
        text += inner + std::string("  ") + entry.dump(), inner = ",\n";
      text += "\n ]";
    } else {
      text += value.dump();
    }
    comma = ",\n";
  }
  return text + "\n}\n";
}

void PrintJson(const std::string& file, const std::string& format, const Moment& m,
               const std::vector<EffectState>& effects, const std::vector<Run>& runs) {
  using nlohmann::ordered_json;
  ordered_json doc;
  doc["file"] = file;
  doc["format"] = format;
  doc["time_ms"] = m.ms;
  doc["frame"] = m.frame >= 0 ? ordered_json(m.frame) : ordered_json();
  doc["frames"] = m.frames;
  auto list = ordered_json::array();
  for (const auto& e : effects) {
    ordered_json j;
    j["family"] = FamilyName(e.address.family);
    j["network"] = e.address.network;
    j["unit"] = e.address.unit;
    j["circuit"] = e.address.circuit;
    j["name"] = e.name;
    j["effect"] = e.on ? ordered_json(EffectTypeName(e.type)) : ordered_json();
    if (e.on && (e.type == kEffectTwinkle || e.type == kEffectShimmer)) {
      j["from"] = e.level;
      j["to"] = e.to;
    } else if (e.on) {
      j["level"] = e.level;
      if (e.type == kEffectFade) j["to"] = e.to;
    }
    if (e.on && e.remainingMs > 0) j["remaining_ms"] = e.remainingMs;
    list.push_back(std::move(j));
  }
  doc["effects"] = std::move(list);
  auto dmx = ordered_json::array();
  auto tav = ordered_json::array();
  for (const auto& run : runs) {
    auto [family, network, unit] = run.key;
    ordered_json j;
    if (family == kFamilyDMX) {
      j["universe"] = network;
      j["first_slot"] = run.first;
      j["first_channel"] = AbsoluteChannel(network, run.first);
      j["levels"] = run.levels;
      dmx.push_back(std::move(j));
    } else {
      j["network"] = network;
      j["unit"] = unit;
      j["first_circuit"] = run.first;
      j["levels"] = run.levels;
      tav.push_back(std::move(j));
    }
  }
  doc["dmx"] = std::move(dmx);
  doc["tav"] = std::move(tav);
  std::cout << JsonLines(doc);
}

// Whether the sequence addresses anything the filter lets through.
bool Addresses(const StreamedSequence& stream, const Filter& filter) {
  for (const auto& channel : stream.Head().channels) {
    const ChannelAddress& a = channel.address;
    if (filter.Address(a.family, a.network, a.circuit)) return true;
  }
  for (const auto& group : stream.Groups()) {
    for (const auto& t : group.tracks) {
      for (int32_t k = 0; k < t.count; ++k) {
        if (filter.Address(t.family, t.network, t.firstAddress + k)) return true;
      }
    }
  }
  return false;
}

}  // namespace

void Levels(const SequenceOptions& o) {
  Filter filter;
  if (o.universe) {
    if (*o.universe < 1 || *o.universe > 63999) {
      throw CommandFailed(
          fmt::format("--universe {} is not a DMX universe (1 to 63999)", *o.universe));
    }
    filter.universe = o.universe;
  }
  if (!o.channels.empty()) {
    auto ranges = ParseRanges(o.channels);
    if (!ranges) {
      throw CommandFailed(fmt::format(
          "--channels \"{}\" is not a list of channels such as 1-512, 42 or 1-10,600-700 "
          "(channels count from 1)",
          o.channels));
    }
    filter.ranges = *ranges;
  }
  auto library = MakeSequenceLibrary(o);
  std::string format = library->FormatOf(o.file);
  auto stream = library->OpenStreamed(o.file);
  if (filter.Any() && !Addresses(*stream, filter)) {
    throw CommandFailed(fmt::format("{} has no {}", o.file, filter.Describe()));
  }
  Moment moment = ChooseMoment(o, *stream, o.file);

  std::vector<EffectState> effects;
  std::map<std::pair<ChannelAddress, std::string>, size_t> byChannel;
  for (const auto& channel : stream->Head().channels) {
    const ChannelAddress& a = channel.address;
    if (!filter.Address(a.family, a.network, a.circuit)) continue;
    if (byChannel.emplace(std::make_pair(a, channel.name), effects.size()).second) {
      effects.push_back({a, channel.name});
    }
  }
  LevelMap levels;
  for (const PlayEvent& e : EventsAt(FramesAt(*stream, moment.ms), moment.ms)) {
    if (e.playEventType == kPlayEventEffect) {
      ChannelAddress a{e.devType, e.lNetwork, e.byteUnit, e.lCircuit};
      auto it = byChannel.find({a, e.szChannelName});
      if (it == byChannel.end()) continue;
      EffectState& state = effects[it->second];
      state.on = true;
      state.type = e.effectType;
      state.level = e.lStartIntensity;
      state.to = e.lEndIntensity;
      state.remainingMs = e.lDuration;
    } else {
      auto& slots = levels[{e.devType, e.lNetwork, e.byteUnit}];
      for (int32_t k = 0; k < e.nIntensityBlobCount; ++k) {
        int32_t address = e.nIntensityBlobStartAddress + k;
        if (filter.Address(e.devType, e.lNetwork, address)) slots[address] = e.byteIntensityBlob[k];
      }
    }
  }
  std::vector<Run> runs = Runs(levels);
  if (o.json) {
    PrintJson(o.file, format, moment, effects, runs);
  } else {
    PrintTable(o.file, moment, effects, runs);
  }
}

}  // namespace tav::showctl
