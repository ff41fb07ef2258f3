#include "TimelineText.h"

#include <fmt/format.h>

#include <string_view>

namespace tav::simulation {
namespace {

std::string DayName(DateTime t) {
  static constexpr std::string_view kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  return std::string(kDays[t.DayOfWeek()]);
}

std::string Plural(int64_t count, std::string_view one, std::string_view many) {
  return fmt::format("{} {}", count, count == 1 ? one : many);
}

}  // namespace

std::string EventLine(const TimelineEvent& e) {
  std::string line = fmt::format("{}  {:<18} {}", e.at.ToText(), EventKindName(e.kind), e.text);
  if (e.kind == EventKind::kShowStart && !e.source.empty()) {
    line += fmt::format("  [{}] {}", e.source, e.reason);
  }
  if (e.repeats > 0) {
    line += fmt::format("  (and {} more {} until {})", e.repeats, e.repeats == 1 ? "time" : "times",
                        e.lastAt.ToText());
  }
  return line;
}

std::string HeadingText(DateTime from, DateTime to) {
  return fmt::format("Simulated from {} {} to {} {}", DayName(from), from.ToText(), DayName(to),
                     to.ToText());
}

std::string SummaryText(const SimulationReport& report) {
  const Timeline& t = report.timeline;
  const OutputCounts& o = report.outputs;
  // Problems by line, and how often they came in all when lines were folded.
  auto problems = [&t](EventKind kind, std::string_view one, std::string_view many) {
    std::string text = Plural(t.Lines(kind), one, many);
    if (t.Count(kind) != t.Lines(kind)) text += fmt::format(" ({} times in all)", t.Count(kind));
    return text;
  };
  std::string text = fmt::format(
      "{}, {}, {}, {}\n", Plural(t.Count(EventKind::kShowStart), "show started", "shows started"),
      Plural(t.Count(EventKind::kSequenceStart), "sequence started", "sequences started"),
      problems(EventKind::kWarning, "warning", "warnings"),
      problems(EventKind::kError, "error", "errors"));
  std::string outputs;
  auto add = [&outputs](const std::string& part) {
    outputs += (outputs.empty() ? "" : ", ") + part;
  };
  if (!o.dmxUniverses.empty()) {
    std::string list;
    for (int32_t u : o.dmxUniverses) list += (list.empty() ? "" : " ") + std::to_string(u);
    add(Plural(static_cast<int64_t>(o.dmxUniverses.size()), "DMX universe", "DMX universes") +
        " (" + list + ")");
  }
  if (!o.tavUnits.empty()) {
    add(Plural(static_cast<int64_t>(o.tavUnits.size()), "TAV unit", "TAV units"));
  }
  if (o.effects > 0) add(Plural(static_cast<int64_t>(o.effects), "effect", "effects"));
  text += outputs.empty() ? "Outputs: none driven\n"
                          : fmt::format("Outputs: {}; {}\n", outputs,
                                        Plural(static_cast<int64_t>(o.frames), "frame", "frames"));
  if (report.endedEarlyAt) {
    text += fmt::format("The player ended early, at {}\n", report.endedEarlyAt->ToText());
  }
  text += report.Failed() ? "Result: FAILED\n" : "Result: OK\n";
  return text;
}

}  // namespace tav::simulation
