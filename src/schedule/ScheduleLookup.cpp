#include "schedule/ScheduleLookup.h"

namespace tav {
namespace {

struct Occurrence {
  std::shared_ptr<ShowEvent> Event;
  std::shared_ptr<TimeRange> Range;
};

std::string Quoted(const std::string& text) {
  return "\"" + text + "\"";
}

std::string SpanText(const TimeRange& range) {
  std::string from = range.HasStart() ? range.StartTime().ToText() : "always";
  std::string to = range.HasEnd() ? range.EndTime().ToText() : "forever";
  if (!range.HasStart() && !range.HasEnd()) return "all week, every week";
  return "from " + from + " to " + to;
}

std::shared_ptr<MonitoredShowEvent> MakeEvent(const std::string& filename,
                                              std::shared_ptr<TimeRange> range, int32_t type) {
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename(filename);
  event->SetRange(std::move(range));
  event->SetScheduleType(type);
  return event;
}

// The dated show whose occurrence holds t. A dated show starts on its key
// date and may end on the next one, so only the dates of t and the day before
// can hold it. Of overlapping shows the earliest start wins, the later of
// equal starts, as in FirstShowWithinRange.
std::optional<Occurrence> DatedShowAt(const YearSchedule& year, DateTime t) {
  std::optional<Occurrence> best;
  const DateTime today = t.DateOnly();
  const auto weekTime = WeekTimeFromDate(t);
  for (DateTime date : {today.AddDays(-1), today}) {
    auto schedule = year.DateSchedule(date);
    if (!schedule) continue;
    for (auto node = schedule->FirstNode(); node; node = node->NextNode()) {
      const auto& event = node->Obj();
      if (event->EventType() != kEventTypeShow) continue;
      // An occurrence can hold t only if the show's span of the week holds
      // t's week time; this cheap test spares the calendar arithmetic.
      if (!weekTime->InRange(*event->StartTime(), *event->EndTime())) continue;
      auto range = event->Range(date);
      if (!range->HasStart() || !range->Includes(t, true, false)) continue;
      if (best && range->StartTime() > best->Range->StartTime()) continue;
      best = Occurrence{event, range};
    }
  }
  return best;
}

// The first weekly show, walking the week circle forward from the event that
// holds `from`, with its occurrence current or next at `from`.
std::optional<Occurrence> NextWeeklyShow(const Schedule& week, DateTime from) {
  auto node = week.GetNodeByTime(*WeekTimeFromDate(from));
  if (!node) return std::nullopt;
  for (int32_t steps = 0; steps < week.Count(); ++steps) {
    if (node->Obj()->EventType() == kEventTypeShow) {
      auto range = node->Obj()->Range(from);
      // Range gives the occurrence that ends exactly at `from` (the one just
      // over, when the walk came round to the show that is ending); the next
      // one is a week later.
      if (range->HasStart() && range->HasEnd() && range->EndTime() <= from) {
        DateTime start = range->StartTime().AddDays(7), end = range->EndTime().AddDays(7);
        range->SetEndTime(end);
        range->SetStartTime(start);
      }
      return Occurrence{node->Obj(), range};
    }
    node = node->NextNode() ? node->NextNode() : week.FirstNode();
  }
  return std::nullopt;
}

DateTime StartOr(const TimeRange& range, DateTime fallback) {
  return range.HasStart() ? range.StartTime() : fallback;
}

}  // namespace

std::string ShowSourceName(ShowSource source) {
  switch (source) {
    case ShowSource::kOnDemand:
      return "show on demand";
    case ShowSource::kYear:
      return "year schedule";
    case ShowSource::kWeek:
      return "week schedule";
    case ShowSource::kNothing:
      break;
  }
  return "nothing";
}

ShowDecision CurrentShowEvent(const ScheduleState& state, DateTime t) {
  std::string passedOver;
  if (state.OnDemand && !state.OnDemand->Filename().empty()) {
    const MonitoredShowEvent& onDemand = *state.OnDemand;
    if (onDemand.Range()->Includes(t, true, false)) {
      auto event = std::make_shared<MonitoredShowEvent>();
      event->CopyFrom(std::make_shared<MonitoredShowEvent>(onDemand));
      return {event, ShowSource::kOnDemand,
              "show on demand " + Quoted(onDemand.Filename()) + " is requested " +
                  SpanText(*onDemand.Range())};
    }
    passedOver = "the show on demand " + Quoted(onDemand.Filename()) + " is requested " +
                 SpanText(*onDemand.Range()) + ", not at this time; ";
  }

  if (state.OnDemandOnly) {
    return {std::make_shared<MonitoredShowEvent>(), ShowSource::kNothing,
            passedOver + "the player runs shows on demand only, so the schedules are ignored"};
  }

  if (state.Year) {
    if (auto dated = DatedShowAt(*state.Year, t)) {
      return {MakeEvent(dated->Event->Filename(), dated->Range, kScheduleTypeYear),
              ShowSource::kYear,
              passedOver + "the year schedule has " + Quoted(dated->Event->Filename()) + " " +
                  SpanText(*dated->Range) + ", which takes precedence over the week schedule"};
    }
    passedOver += "no dated show runs at this time; ";
  }

  auto node = state.Week ? state.Week->GetNodeByTime(*WeekTimeFromDate(t)) : nullptr;
  if (!node) {
    return {std::make_shared<MonitoredShowEvent>(), ShowSource::kNothing,
            passedOver + "there is no week schedule entry for this time"};
  }
  const auto& event = node->Obj();
  if (event->EventType() == kEventTypeShow) {
    auto range = event->Range(t);
    return {MakeEvent(event->Filename(), range, kScheduleTypeWeek), ShowSource::kWeek,
            passedOver + "the week schedule has " + Quoted(event->Filename()) + " every " +
                event->StartTime()->ToString().substr(0, 3) + " " +
                event->StartTime()->DayTimeToString() + " to " +
                event->EndTime()->ToString().substr(0, 3) + " " +
                event->EndTime()->DayTimeToString() + ", this time " + SpanText(*range)};
  }
  auto wait = state.Week->AmalgamatedShowEvent(event);
  auto range = wait->Range(t);
  return {MakeEvent("", range, kScheduleTypeWeek), ShowSource::kWeek,
          passedOver + "the week schedule has no show at this time (it waits " + SpanText(*range) +
              ")"};
}

ShowDecision NextShowEvent(const ScheduleState& state,
                           const std::shared_ptr<const MonitoredShowEvent>& current, DateTime t) {
  if (state.OnDemandOnly) {
    return {nullptr, ShowSource::kNothing,
            "the player runs shows on demand only, so no scheduled show follows"};
  }
  DateTime from = t;
  const bool currentIsShow = current && !current->Filename().empty();
  if (currentIsShow) {
    const TimeRange& range = *current->Range();
    if (!range.HasEnd()) {
      return {nullptr, ShowSource::kNothing,
              "the current show " + Quoted(current->Filename()) + " has no end"};
    }
    if (range.EndTime() > t) from = range.EndTime();
  }
  // Dated shows take precedence over weekly ones, so one may start while a
  // weekly show is still running.
  const DateTime yearFrom =
      currentIsShow && current->ScheduleType() == kScheduleTypeWeek ? t : from;

  std::optional<Occurrence> dated;
  if (state.Year) {
    auto after = std::make_shared<TimeRange>();
    after->SetStartTime(yearFrom);
    DateTime start;
    if (auto event = state.Year->FirstShowWithinRange(after, start)) {
      // The occurrence that starts on that date, with its end.
      dated = Occurrence{event, event->Range(start.DateOnly())};
    }
  }
  std::optional<Occurrence> weekly;
  if (state.Week) weekly = NextWeeklyShow(*state.Week, from);

  if (dated && (!weekly || StartOr(*dated->Range, yearFrom) <= StartOr(*weekly->Range, from))) {
    return {MakeEvent(dated->Event->Filename(), dated->Range, kScheduleTypeYear), ShowSource::kYear,
            "next is the dated show " + Quoted(dated->Event->Filename()) + " " +
                SpanText(*dated->Range)};
  }
  if (weekly) {
    return {MakeEvent(weekly->Event->Filename(), weekly->Range, kScheduleTypeWeek),
            ShowSource::kWeek,
            "next is the weekly show " + Quoted(weekly->Event->Filename()) + " " +
                SpanText(*weekly->Range)};
  }
  return {nullptr, ShowSource::kNothing, "no show is scheduled after " + from.ToText()};
}

}  // namespace tav
