#pragma once
// The timeline as a person reads it: one line per event, its date and time,
// its kind and what happened; a show start says which source chose the show
// (on demand, year, week) and why; folded repetitions are counted. The
// summary at the end counts shows, sequences, warnings and errors and says
// which outputs would have been driven.

#include <string>

#include "Simulation.h"
#include "Timeline.h"

namespace tav::simulation {

// "2024-12-24 18:00:05  show-start         xmas.show  [week] the week ..."
std::string EventLine(const TimelineEvent& event);

// The heading: the span simulated, with the weekdays.
std::string HeadingText(DateTime from, DateTime to);

// Several lines, each ending in a line break; the last says whether
// anything failed.
std::string SummaryText(const SimulationReport& report);

}  // namespace tav::simulation
