#include "schedule/YearSchedule.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include "support/Error.h"
#include "support/Numbers.h"
#include "support/Serialize.h"

namespace tav {
namespace {

constexpr const char* kAddSource = "Schedule.AddShowEventByFile";

int16_t DatePart(std::string_view text) {
  std::optional<double> value = ParseNumber(text);
  if (!value) throw errors::TypeMismatch("YearSchedule.DateStringToDate");
  return ToInt16(*value);
}

// Floor division, so negative month counts roll back into earlier years.
int64_t FloorDiv(int64_t a, int64_t b) {
  return a / b - ((a % b != 0) && ((a < 0) != (b < 0)) ? 1 : 0);
}

}  // namespace

std::string YearSchedule::DateToString(DateTime date) {
  // Written by hand rather than with snprintf: the host looks dates up every
  // second, and this is most of the cost of a lookup.
  int year = date.Year(), month = date.Month(), day = date.Day();
  if (year < 0 || year > 9999) {
    char buffer[32];
    std::snprintf(buffer, sizeof buffer, "%04d-%02d-%02d", year, month, day);
    return buffer;
  }
  std::string key = "0000-00-00";
  for (int i = 3; i >= 0; --i, year /= 10)
    key[static_cast<size_t>(i)] = static_cast<char>('0' + year % 10);
  key[5] = static_cast<char>('0' + month / 10);
  key[6] = static_cast<char>('0' + month % 10);
  key[8] = static_cast<char>('0' + day / 10);
  key[9] = static_cast<char>('0' + day % 10);
  return key;
}

DateTime YearSchedule::DateStringToDate(std::string_view szDateString) {
  std::vector<std::string_view> parts;
  size_t begin = 0;
  for (;;) {
    size_t dash = szDateString.find('-', begin);
    parts.push_back(
        szDateString.substr(begin, dash == std::string_view::npos ? dash : dash - begin));
    if (dash == std::string_view::npos) break;
    begin = dash + 1;
  }
  if (parts.size() != 3) {
    throw Error(37, "YearSchedule.DateStringToDate",
                "Unexpected date string format: " + std::string(szDateString));
  }
  int64_t year = DatePart(parts[0]);
  int64_t month = DatePart(parts[1]);
  int64_t day = DatePart(parts[2]);
  // Two-digit years as the platform's date arithmetic reads them.
  if (year >= 0 && year <= 29) year += 2000;
  if (year >= 30 && year <= 99) year += 1900;
  int64_t months = year * 12 + (month - 1);
  int64_t rolledYear = FloorDiv(months, 12);
  int rolledMonth = static_cast<int>(months - rolledYear * 12) + 1;
  if (rolledYear < 100 || rolledYear > 9999) {
    throw errors::InvalidProcedureCall("YearSchedule.DateStringToDate");
  }
  return DateTime::FromParts(static_cast<int>(rolledYear), rolledMonth, 1).AddDays(day - 1);
}

std::shared_ptr<Schedule> YearSchedule::ScheduleByKey(const std::string& key) const {
  auto found = m_schedules.find(key);
  return found == m_schedules.end() ? nullptr : found->second;
}

std::shared_ptr<Schedule> YearSchedule::DateSchedule(DateTime SchedDate) const {
  return ScheduleByKey(DateToString(SchedDate));
}

void YearSchedule::AddSchedule(DateTime SchedDate, std::shared_ptr<Schedule> Sched) {
  if (!Sched) throw errors::ObjectNotSet("YearSchedule.AddSchedule");
  m_modified = true;
  std::string key = DateToString(SchedDate);
  if (m_schedules.count(key) != 0) throw errors::KeyAlreadyAssociated("YearSchedule.AddSchedule");
  DateTime keyDate = DateStringToDate(key);
  m_schedules.emplace(key, std::move(Sched));
  m_keys.push_back(std::move(key));
  m_keyDates.push_back(keyDate);
}

std::shared_ptr<ShowEvent> YearSchedule::FirstShowWithinRange(
    const std::shared_ptr<TimeRange>& trRange, DateTime& dtFirstShowStartTime) const {
  std::shared_ptr<TimeRange> range = trRange ? trRange : std::make_shared<TimeRange>();
  std::shared_ptr<ShowEvent> best;
  DateTime bestStart;
  for (size_t i = 0; i < m_keys.size(); ++i) {
    const std::string& key = m_keys[i];
    const DateTime date = m_keyDates[i];  // DateStringToDate(key), read once
    // No show of this date can start before a show already found.
    if (best && bestStart < date) continue;
    // Two days: a dated show may end on the next day.
    TimeRange daySpan;
    daySpan.SetStartTime(date);
    daySpan.SetEndTime(date.AddDays(2));
    if (!daySpan.Overlaps(range, true, false, true, false)) continue;

    for (auto node = m_schedules.at(key)->FirstNode(); node; node = node->NextNode()) {
      const auto& event = node->Obj();
      if (event->EventType() != kEventTypeShow) continue;
      auto occurrence = event->Range(date);
      if (!occurrence->HasStart()) continue;
      if (best && occurrence->StartTime() > bestStart) continue;
      if (!occurrence->Overlaps(range, true, false, true, false)) continue;
      best = event;
      bestStart = occurrence->StartTime();
    }
  }
  if (best) dtFirstShowStartTime = bestStart;
  return best;
}

void YearSchedule::AddShowEventByFile(std::string szFilename, DateTime start, DateTime end) {
  auto wtStart = WeekTimeFromDate(start);
  auto wtEnd = WeekTimeFromDate(end);
  if (!(start < end)) throw Error(1, kAddSource, "End time precedes start time");
  m_modified = true;

  auto days = std::llround(end.DateOnly().Serial() - start.DateOnly().Serial());
  if (days == 1) {
    // The show runs past midnight: it must end before the next date's first
    // show and start after this date's last one.
    if (auto next = DateSchedule(end)) {
      auto first = next->FirstShowEvent();
      if (first && !wtEnd->BetweenEquals(*wtStart, *first->StartTime())) {
        throw Error(3, kAddSource, "End time conficts with event in next day");
      }
    }
    if (auto same = DateSchedule(start)) {
      auto last = same->LastShowEvent();
      if (last && !wtStart->BetweenEquals(*last->EndTime(), *wtEnd)) {
        throw Error(4, kAddSource, "Start time conflicts with event in previous day");
      }
    }
  } else if (days >= 2) {
    throw Error(2, kAddSource, "Event spans more than two days");
  }

  // The show lives only in its start date's schedule, also when it ends on
  // the next day.
  std::string key = DateToString(start);
  auto schedule = ScheduleByKey(key);
  if (!schedule) {
    schedule = std::make_shared<Schedule>();
    schedule->AddShowEventByFile(std::move(szFilename), wtStart, wtEnd);
    DateTime keyDate = DateStringToDate(key);
    m_schedules.emplace(key, schedule);
    m_keyDates.push_back(keyDate);
    m_keys.push_back(key);
  } else if (schedule->CheckAdd(*wtStart, *wtEnd) == 0) {
    schedule->AddShowEventByFile(std::move(szFilename), wtStart, wtEnd);
  } else {
    throw Error(4, kAddSource, "Event conflict");
  }
}

void YearSchedule::RemoveShowEvent(DateTime ShowDate, const std::shared_ptr<Node>& ShowNode) {
  m_modified = true;
  std::string key = DateToString(ShowDate);
  auto schedule = ScheduleByKey(key);
  if (!schedule) throw errors::ObjectNotSet("YearSchedule.RemoveShowEvent");
  schedule->RemoveShowEvent(ShowNode);
  if (schedule->Count() == 1) {
    m_schedules.erase(key);
    auto index = std::find(m_keys.begin(), m_keys.end(), key) - m_keys.begin();
    m_keys.erase(m_keys.begin() + index);
    m_keyDates.erase(m_keyDates.begin() + index);
  }
}

bool YearSchedule::Save(const std::string& szFilename, TextFileStore& files) {
  bool result = WriteTextFile(szFilename, YearScheduleToText(*this), files);
  m_modified = false;
  return result;
}

std::string YearScheduleToText(const YearSchedule& yearSchedule) {
  if (yearSchedule.Keys().empty()) return "";
  std::vector<std::string> days;
  days.reserve(yearSchedule.Keys().size());
  for (const std::string& key : yearSchedule.Keys()) {
    days.push_back(ListToText({EscapeText(key), ScheduleToText(*yearSchedule.ScheduleByKey(key))}));
  }
  return ListToText(days);
}

std::shared_ptr<YearSchedule> YearScheduleFromText(std::string_view text) {
  TextArray days = ListFromText(text, 1);
  auto yearSchedule = std::make_shared<YearSchedule>();
  for (int32_t i = 1; i <= ArrayCount(days); ++i) {
    TextArray day = ListFromText(days[i], 1);
    DateTime date = DateFromText(day[1]);
    yearSchedule->AddSchedule(date, ScheduleFromText(day[2]));
  }
  return yearSchedule;
}

std::shared_ptr<YearSchedule> LoadYearSchedule(const std::string& path, TextFileStore& files) {
  std::optional<std::string> text;
  try {
    text = files.ReadText(path);
  } catch (const Error&) {
    // An unreadable file counts as no file: the player starts with no dated
    // shows rather than not at all.
  }
  auto yearSchedule = text ? YearScheduleFromText(*text) : std::make_shared<YearSchedule>();
  yearSchedule->SetModified(false);
  return yearSchedule;
}

}  // namespace tav
