#include "schedule/ShowEvent.h"

#include "support/Error.h"
#include "support/Numbers.h"
#include "support/Serialize.h"

namespace tav {

ShowEvent::ShowEvent()
    : m_startTime(std::make_shared<WeekTime>()), m_endTime(std::make_shared<WeekTime>()) {}

void ShowEvent::SetEventType(int32_t value) {
  m_eventType = value;
  if (value == kEventTypeWait) m_filename.clear();
}

void ShowEvent::SetFilename(std::string value) {
  m_filename = std::move(value);
  m_eventType = m_filename.empty() ? kEventTypeWait : kEventTypeShow;
}

void ShowEvent::SetStartTime(std::shared_ptr<WeekTime> NewStart) {
  m_startTime = std::move(NewStart);
  if (!m_endTime) {
    if (m_duration != -1) {
      if (!m_startTime) throw errors::ObjectNotSet("ShowEvent.StartTime");
      m_endTime = m_startTime->PlusDuration(m_duration);
    }
  } else {
    if (!m_startTime) throw errors::ObjectNotSet("ShowEvent.StartTime");
    m_duration = m_endTime->Minus(*m_startTime);
  }
}

void ShowEvent::SetEndTime(std::shared_ptr<WeekTime> NewEnd) {
  m_endTime = std::move(NewEnd);
  if (!m_startTime) {
    if (m_duration != -1) {
      if (!m_endTime) throw errors::ObjectNotSet("ShowEvent.EndTime");
      m_startTime = m_endTime->MinusDuration(m_duration);
    }
  } else {
    if (!m_endTime) throw errors::ObjectNotSet("ShowEvent.EndTime");
    m_duration = m_endTime->Minus(*m_startTime);
  }
}

void ShowEvent::SetDuration(int32_t Duration) {
  if (!m_startTime) throw errors::ObjectNotSet("ShowEvent.SetDuration");
  m_endTime = m_startTime->PlusDuration(Duration);
  m_duration = Duration;
}

std::shared_ptr<TimeRange> ShowEvent::Range(DateTime dtReference) const {
  if (!m_startTime || !m_endTime) throw errors::ObjectNotSet("ShowEvent.Range");
  auto range = std::make_shared<TimeRange>();
  if (m_startTime->TimeVal() == m_endTime->TimeVal()) return range;  // fills the week

  DateTime start = WeekTimeToDate(*m_startTime, dtReference);
  DateTime end = WeekTimeToDate(*m_endTime, dtReference);
  if (start >= end) {
    // Runs across the week end: the occurrence began last week or ends next week.
    if (end >= dtReference) {
      start = start.AddDays(-7);
    } else {
      end = end.AddDays(7);
    }
  } else if (end < dtReference) {
    // This week's occurrence is over; the next one is a week later.
    start = start.AddDays(7);
    end = end.AddDays(7);
  }
  range->SetStartTime(start);
  range->SetEndTime(end);
  return range;
}

std::shared_ptr<ShowEvent> NewWaitEvent(std::shared_ptr<WeekTime> Start, int32_t Duration) {
  auto event = std::make_shared<ShowEvent>();
  event->SetEventType(kEventTypeWait);
  event->SetStartTime(std::move(Start));
  event->SetDuration(Duration);
  return event;
}

std::shared_ptr<ShowEvent> NewShowEvent(std::string szFilename, std::shared_ptr<WeekTime> StartTime,
                                        std::shared_ptr<WeekTime> EndTime) {
  auto event = std::make_shared<ShowEvent>();
  event->SetEventType(kEventTypeShow);
  event->SetFilename(std::move(szFilename));
  event->SetStartTime(std::move(StartTime));
  event->SetEndTime(std::move(EndTime));
  return event;
}

std::string ShowEventToText(const ShowEvent& event) {
  if (!event.StartTime() || !event.EndTime()) throw errors::ObjectNotSet("ShowEventToText");
  // The first two fields of the file reference mean nothing to the player;
  // they are written as the suite's editor expects them.
  std::string fileReference = ListToText({"", LongToText(0), EscapeText(event.Filename())});
  return ListToText({WeekTimeToText(*event.EndTime()), std::to_string(event.EventType()),
                     fileReference, WeekTimeToText(*event.StartTime())});
}

std::shared_ptr<ShowEvent> ShowEventFromText(std::string_view text) {
  TextArray fields = ListFromText(text, 1);
  auto event = std::make_shared<ShowEvent>();
  event->SetEndTime(WeekTimeFromText(fields[1]));
  std::optional<double> type = ParseNumber(UnescapeText(fields[2]));
  if (!type) throw errors::TypeMismatch("ShowEventFromText");
  event->SetEventType(ToInt32(*type));
  TextArray fileReference = ListFromText(fields[3], 1);
  event->SetFilename(UnescapeText(fileReference[3]));
  event->SetStartTime(WeekTimeFromText(fields[4]));
  return event;
}

}  // namespace tav
