#pragma once
// A repeating week of show events: for every second of the week it says which
// show file runs or that nothing runs (a wait). The week schedule file holds
// one; the year schedule holds one per date.
//
// Invariant: the events tile the whole week in list order, without gaps or
// overlaps, each event's end being the next one's start and the last one's
// end the first one's start. The list is never empty, may start anywhere on
// the week circle, and one event (first or last) may run across the week end.
// Adding a show carves its span out of a wait; removing one turns it back into
// wait time, merged with neighbouring waits (but never across the week end).
//
// Owned by the host (the week schedule) or by a YearSchedule (one per date).
// Errors are thrown as tav::Error; Modified records that a save is due.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "schedule/LinkedList.h"
#include "schedule/ShowEvent.h"
#include "schedule/TextFileStore.h"
#include "schedule/WeekTime.h"

namespace tav {

// Receives the lines of DebugDump. Schedules start with none: in production
// the dump costs nothing and writes nothing.
using DebugSink = std::function<void(std::string_view line)>;

class Schedule {
 public:
  // One wait filling the week from Sunday 00:00:00.
  Schedule();

  bool Modified() const { return m_modified; }
  void SetModified(bool value) { m_modified = value; }
  const std::shared_ptr<Node>& FirstNode() const { return m_list->FirstNode(); }
  const std::shared_ptr<Node>& LastNode() const { return m_list->LastNode(); }
  int32_t Count() const { return m_list->Count(); }

  // The first node, from FirstNode forward, whose event contains the time
  // (start included, end excluded); null when none does.
  std::shared_ptr<Node> GetNodeByTime(const WeekTime& time) const;
  // The first show walking forward from FirstNode / backward from LastNode.
  std::shared_ptr<ShowEvent> FirstShowEvent() const;
  std::shared_ptr<ShowEvent> LastShowEvent() const;

  // Inserts the show into the wait that holds its start. Fails with errors 1
  // to 3, "Can't add event -- event conflict", from "Schedule.AddShowEvent".
  // Modified is set even when a later step fails.
  void AddShowEvent(const std::shared_ptr<ShowEvent>& E);
  void AddShowEventByFile(std::string szFilename, std::shared_ptr<WeekTime> StartTime,
                          std::shared_ptr<WeekTime> EndTime);
  // Turns the node's show back into wait time. Fails with error 1, "Can not
  // remove non-show event", for a wait.
  void RemoveShowEvent(const std::shared_ptr<Node>& ShowNode);
  // 0 when a show with these bounds could be added inside one wait; 1 (start
  // not in a wait), 2 (end past the wait) or 3 (would run the long way round)
  // otherwise. Changes nothing; ignores the week-end wrap AddShowEvent allows.
  int32_t CheckAdd(const WeekTime& StartTime, const WeekTime& EndTime) const;
  // For a wait that the list splits at Sunday 00:00:00, a new wait joined with
  // the wait on the other side of the week end; otherwise the event itself.
  std::shared_ptr<ShowEvent> AmalgamatedShowEvent(
      const std::shared_ptr<ShowEvent>& ShowNodeEvent) const;

  // Writes the week schedule file through `files`. Modified is cleared
  // whatever the result; false when the file could not be written (the old
  // file then stays as it was).
  bool Save(const std::string& szFilename, TextFileStore& files);

  // "BEGIN SCHEDULE DUMP", one line per event, "END SCHEDULE DUMP".
  void DebugDump() const;
  void SetDebugSink(DebugSink sink) { m_debugSink = std::move(sink); }

 private:
  void Reset();

  std::shared_ptr<LinkedList> m_list;
  bool m_modified = false;
  DebugSink m_debugSink;
};

// The week schedule file's list of show records, waits left out; the empty
// text for a schedule without shows.
std::string ScheduleToText(const Schedule& schedule);
// A new schedule with the records added one by one; the first conflicting or
// malformed record aborts with its error.
std::shared_ptr<Schedule> ScheduleFromText(std::string_view text);
// Writes the text and one CR LF; false on any failure.
bool WriteTextFile(const std::string& szFilename, std::string_view text, TextFileStore& files);
// The week schedule file: a new empty schedule when the file does not exist,
// Modified cleared after loading. Read and format errors are thrown.
std::shared_ptr<Schedule> LoadWeekSchedule(const std::string& path, TextFileStore& files);

}  // namespace tav
