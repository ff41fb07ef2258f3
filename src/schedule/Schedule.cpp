#include "schedule/Schedule.h"

#include <vector>

#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {
namespace {

constexpr const char* kAddSource = "Schedule.AddShowEvent";
constexpr const char* kConflict = "Can't add event -- event conflict";

bool IsWait(const ShowEvent& event) {
  return event.EventType() == kEventTypeWait;
}

// The event a node holds, or the unset-object error for a missing node (a
// schedule whose week times were read out of range has no node for a time).
ShowEvent& EventOf(const std::shared_ptr<Node>& node, const char* source) {
  if (!node || !node->Obj()) throw errors::ObjectNotSet(source);
  return *node->Obj();
}

}  // namespace

Schedule::Schedule() {
  Reset();
}

void Schedule::Reset() {
  m_list = NewSingleNodeList(NewWaitEvent(NewWeekTime(0, 0, 0, 0), kSecondsPerWeek));
}

std::shared_ptr<Node> Schedule::GetNodeByTime(const WeekTime& time) const {
  for (auto node = m_list->FirstNode(); node; node = node->NextNode()) {
    const ShowEvent& event = *node->Obj();
    if (time.InRange(*event.StartTime(), *event.EndTime())) return node;
  }
  return nullptr;
}

std::shared_ptr<ShowEvent> Schedule::FirstShowEvent() const {
  for (auto node = m_list->FirstNode(); node; node = node->NextNode()) {
    if (node->Obj()->EventType() == kEventTypeShow) return node->Obj();
  }
  return nullptr;
}

std::shared_ptr<ShowEvent> Schedule::LastShowEvent() const {
  for (auto node = m_list->LastNode(); node; node = node->PreviousNode()) {
    if (node->Obj()->EventType() == kEventTypeShow) return node->Obj();
  }
  return nullptr;
}

void Schedule::AddShowEvent(const std::shared_ptr<ShowEvent>& E) {
  if (!E || !E->StartTime() || !E->EndTime()) throw errors::ObjectNotSet(kAddSource);
  const WeekTime& start = *E->StartTime();
  const WeekTime& end = *E->EndTime();

  std::shared_ptr<Node> C = GetNodeByTime(start);
  ShowEvent& CE = EventOf(C, kAddSource);
  if (!IsWait(CE)) throw Error(1, kAddSource, kConflict);
  m_modified = true;

  // A wait whose start equals its end fills the week, so no show can run past
  // it. Its end must not be taken for a point in time: the week-end edit
  // below would then empty the only wait and fail to delete it, and a show
  // crossing Saturday midnight could never be added to an empty schedule (nor
  // a saved schedule holding just such a show be read back).
  const bool waitFillsWeek = CE.StartTime()->Equals(*CE.EndTime());
  if (!waitFillsWeek && !end.BetweenEquals(start, *CE.EndTime())) {
    // The show runs past the end of its wait. That is allowed only across the
    // week end, where the last and the first wait are one wait split in two:
    // move their common boundary to the show's end, in place, so the last wait
    // holds the whole show and the first begins where it ends.
    ShowEvent& F = *m_list->FirstNode()->Obj();
    ShowEvent& L = *m_list->LastNode()->Obj();
    if (IsWait(F) && IsWait(L) && start.BetweenEquals(*L.StartTime(), *L.EndTime()) &&
        end.BetweenEquals(*F.StartTime(), *F.EndTime())) {
      F.StartTime()->SetTimeVal(end.TimeVal());
      L.EndTime()->SetTimeVal(end.TimeVal());
      // An empty wait would otherwise stand for the whole week.
      if (F.StartTime()->TimeVal() == F.EndTime()->TimeVal()) {
        m_list->DeleteNode(m_list->FirstNode());
      }
    } else {
      throw Error(2, kAddSource, kConflict);
    }
  }

  if (m_list->Count() == 1) {
    ShowEvent& W = CE;
    if (!IsWait(W)) throw Error(3, kAddSource, kConflict);
    if (W.StartTime()->BetweenEquals(start, end)) {
      // The wait's start lies inside the show: the wait becomes the rest of
      // the week after the show.
      W.SetStartTime(E->EndTime());
      W.SetEndTime(E->StartTime());
      m_list->InsertAfter(C, E);
    } else {
      auto W2 = NewShowEvent("", E->EndTime(), W.EndTime());
      W.SetEndTime(E->StartTime());
      auto showNode = m_list->InsertAfter(C, E);
      m_list->InsertAfter(showNode, W2);
    }
    return;
  }

  const bool startsEqual = start.Equals(*CE.StartTime());
  const bool endsEqual = end.Equals(*CE.EndTime());
  if (startsEqual && endsEqual) {
    m_list->InsertAfter(C, E);  // the show replaces the wait
    m_list->DeleteNode(C);
  } else if (startsEqual) {
    CE.SetStartTime(E->EndTime());
    m_list->InsertBefore(C, E);
  } else if (endsEqual) {
    CE.SetEndTime(E->StartTime());
    m_list->InsertAfter(C, E);
  } else {
    auto W2 = NewShowEvent("", E->EndTime(), CE.EndTime());
    CE.SetEndTime(E->StartTime());
    auto showNode = m_list->InsertAfter(C, E);
    m_list->InsertAfter(showNode, W2);
  }
}

void Schedule::AddShowEventByFile(std::string szFilename, std::shared_ptr<WeekTime> StartTime,
                                  std::shared_ptr<WeekTime> EndTime) {
  AddShowEvent(NewShowEvent(std::move(szFilename), std::move(StartTime), std::move(EndTime)));
}

void Schedule::RemoveShowEvent(const std::shared_ptr<Node>& ShowNode) {
  constexpr const char* kSource = "Schedule.RemoveShowEvent";
  DebugDump();
  ShowEvent& R = EventOf(ShowNode, kSource);
  if (R.EventType() != kEventTypeShow) throw Error(1, kSource, "Can not remove non-show event");
  m_modified = true;

  auto P = ShowNode->PreviousNode();
  auto N = ShowNode->NextNode();
  if (!P && !N) {
    R.SetEventType(kEventTypeWait);
  } else if (P && !N) {
    ShowEvent& PE = *P->Obj();
    if (IsWait(PE)) {
      m_list->DeleteNode(ShowNode);
      PE.SetEndTime(R.EndTime());
    } else {
      R.SetEventType(kEventTypeWait);
    }
  } else if (!P && N) {
    ShowEvent& NE = *N->Obj();
    if (IsWait(NE)) {
      m_list->DeleteNode(ShowNode);
      NE.SetStartTime(R.StartTime());
    } else {
      R.SetEventType(kEventTypeWait);
    }
  } else {
    ShowEvent& PE = *P->Obj();
    ShowEvent& NE = *N->Obj();
    if (!IsWait(PE) && !IsWait(NE)) {
      R.SetEventType(kEventTypeWait);
    } else if (IsWait(NE) && !IsWait(PE)) {
      m_list->DeleteNode(ShowNode);
      NE.SetStartTime(R.StartTime());
    } else if (IsWait(PE) && !IsWait(NE)) {
      m_list->DeleteNode(ShowNode);
      PE.SetEndTime(R.EndTime());
    } else {
      m_list->DeleteNode(ShowNode);
      m_list->DeleteNode(N);
      PE.SetEndTime(NE.EndTime());
    }
  }

  if (m_list->Count() == 1) Reset();
  DebugDump();
}

int32_t Schedule::CheckAdd(const WeekTime& StartTime, const WeekTime& EndTime) const {
  const ShowEvent& CE = EventOf(GetNodeByTime(StartTime), "Schedule.CheckAdd");
  if (!IsWait(CE) || !StartTime.BetweenEquals(*CE.StartTime(), *CE.EndTime())) return 1;
  if (!EndTime.BetweenEquals(*CE.StartTime(), *CE.EndTime())) return 2;
  if (!StartTime.BetweenEquals(*CE.StartTime(), EndTime)) return 3;
  return 0;
}

std::shared_ptr<ShowEvent> Schedule::AmalgamatedShowEvent(
    const std::shared_ptr<ShowEvent>& ShowNodeEvent) const {
  if (!ShowNodeEvent) return nullptr;
  if (!IsWait(*ShowNodeEvent)) return ShowNodeEvent;
  if (!ShowNodeEvent->StartTime() || !ShowNodeEvent->EndTime())
    throw errors::ObjectNotSet("Schedule.AmalgamatedShowEvent");
  if (ShowNodeEvent->StartTime()->TimeVal() == 0 && ShowNodeEvent->EndTime()->TimeVal() == 0) {
    return ShowNodeEvent;
  }
  std::shared_ptr<ShowEvent> result = ShowNodeEvent;
  const auto& last = m_list->LastNode()->Obj();
  if (result->StartTime()->TimeVal() == 0 && IsWait(*last)) {
    result = NewShowEvent("", last->StartTime(), result->EndTime());
  }
  const auto& first = m_list->FirstNode()->Obj();
  if (result->EndTime()->TimeVal() == 0 && IsWait(*first)) {
    result = NewShowEvent("", result->StartTime(), first->EndTime());
  }
  return result;
}

bool Schedule::Save(const std::string& szFilename, TextFileStore& files) {
  bool result = WriteTextFile(szFilename, ScheduleToText(*this), files);
  DebugDump();
  m_modified = false;
  return result;
}

void Schedule::DebugDump() const {
  if (!m_debugSink) return;
  m_debugSink("BEGIN SCHEDULE DUMP");
  for (auto node = m_list->FirstNode(); node; node = node->NextNode()) {
    const ShowEvent& event = *node->Obj();
    m_debugSink(event.StartTime()->ToString() + " - " + event.EndTime()->ToString() + " " +
                (IsWait(event) ? std::string("WAIT") : event.Filename()));
  }
  m_debugSink("END SCHEDULE DUMP");
}

std::string ScheduleToText(const Schedule& schedule) {
  std::vector<std::string> records;
  for (auto node = schedule.FirstNode(); node; node = node->NextNode()) {
    if (node->Obj()->EventType() == kEventTypeShow)
      records.push_back(ShowEventToText(*node->Obj()));
  }
  return records.empty() ? std::string() : ListToText(records);
}

std::shared_ptr<Schedule> ScheduleFromText(std::string_view text) {
  TextArray fields = ListFromText(text, 1);
  auto schedule = std::make_shared<Schedule>();
  for (int32_t i = 1; i <= ArrayCount(fields); ++i) {
    schedule->AddShowEvent(ShowEventFromText(fields[i]));
  }
  return schedule;
}

bool WriteTextFile(const std::string& szFilename, std::string_view text, TextFileStore& files) {
  try {
    std::string content(text);
    content += "\r\n";
    files.WriteText(szFilename, content);
    return true;
  } catch (...) {
    return false;
  }
}

std::shared_ptr<Schedule> LoadWeekSchedule(const std::string& path, TextFileStore& files) {
  std::optional<std::string> text = files.ReadText(path);
  auto schedule = text ? ScheduleFromText(*text) : std::make_shared<Schedule>();
  schedule->SetModified(false);
  return schedule;
}

}  // namespace tav
