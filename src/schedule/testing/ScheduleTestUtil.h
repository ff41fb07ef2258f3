#pragma once
// Helpers shared by the schedule tests: week times from short texts, a one-line
// picture of a schedule, and the tiling check every edit must pass.

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <functional>
#include <string>

#include "schedule/Schedule.h"
#include "support/Error.h"
#include "support/testing/Failure.h"

namespace tav::testing {

// "Mon 18:00" or "Sat 23:59:59".
inline std::shared_ptr<WeekTime> T(const char* text) {
  static const char* const kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  int day = -1;
  for (int d = 0; d < 7; ++d) {
    if (std::strncmp(text, kDays[d], 3) == 0) day = d;
  }
  int hour = 0, minute = 0, second = 0;
  if (day < 0 || std::sscanf(text + 3, " %d:%d:%d", &hour, &minute, &second) < 2) {
    ADD_FAILURE() << "bad week time in test: " << text;
  }
  return NewWeekTime(day, hour, minute, second);
}

inline std::string Text(const WeekTime& w) {
  static const char* const kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  char buffer[32];
  if (w.Second() != 0) {
    std::snprintf(buffer, sizeof buffer, "%s %02d:%02d:%02d", kDays[(w.Day() + 7) % 7], w.Hour(),
                  w.Minute(), w.Second());
  } else {
    std::snprintf(buffer, sizeof buffer, "%s %02d:%02d", kDays[(w.Day() + 7) % 7], w.Hour(),
                  w.Minute());
  }
  return buffer;
}

// "Sun 00:00-Mon 18:00 wait | Mon 18:00-Mon 22:00 Xmas | ...", in list order.
inline std::string Describe(const Schedule& schedule) {
  std::string text;
  for (auto node = schedule.FirstNode(); node; node = node->NextNode()) {
    const ShowEvent& e = *node->Obj();
    if (!text.empty()) text += " | ";
    text += Text(*e.StartTime()) + "-" + Text(*e.EndTime()) + " " +
            (e.EventType() == kEventTypeWait ? std::string("wait") : e.Filename());
  }
  return text;
}

// The invariant: the list is consistent in both directions, and its events
// tile the week: each ends where the next starts, the last where the first
// starts, and together they last exactly one week.
inline ::testing::AssertionResult Tiles(const Schedule& schedule) {
  int32_t count = 0;
  int64_t total = 0;
  std::shared_ptr<Node> previous;
  for (auto node = schedule.FirstNode(); node; node = node->NextNode()) {
    if (node->PreviousNode() != previous)
      return ::testing::AssertionFailure() << "broken back link: " << Describe(schedule);
    const ShowEvent& e = *node->Obj();
    for (int32_t t : {e.StartTime()->TimeVal(), e.EndTime()->TimeVal()}) {
      if (t < 0 || t >= kSecondsPerWeek)
        return ::testing::AssertionFailure() << "time outside the week: " << Describe(schedule);
    }
    if (auto next = node->NextNode()) {
      if (!e.EndTime()->Equals(*next->Obj()->StartTime()))
        return ::testing::AssertionFailure() << "gap or overlap: " << Describe(schedule);
    }
    int32_t length = e.EndTime()->Minus(*e.StartTime());
    total += length == 0 ? kSecondsPerWeek : length;
    previous = node;
    ++count;
  }
  if (previous != schedule.LastNode())
    return ::testing::AssertionFailure() << "LastNode is not the end of the list";
  if (count != schedule.Count())
    return ::testing::AssertionFailure() << "Count " << schedule.Count() << ", walked " << count;
  if (!schedule.LastNode()->Obj()->EndTime()->Equals(*schedule.FirstNode()->Obj()->StartTime()))
    return ::testing::AssertionFailure() << "last end is not first start: " << Describe(schedule);
  if (total != kSecondsPerWeek)
    return ::testing::AssertionFailure()
           << "events last " << total << " s, not a week: " << Describe(schedule);
  return ::testing::AssertionSuccess();
}

}  // namespace tav::testing
