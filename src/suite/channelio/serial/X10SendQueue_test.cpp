#include "suite/channelio/serial/X10SendQueue.h"

#include <gtest/gtest.h>

namespace tav {
namespace {

// The queue's transmissions as text, commands separated by " | ".
std::string Drain(X10SendQueue& queue) {
  std::string text;
  while (!queue.Empty()) {
    if (!text.empty()) text += " | ";
    std::string command;
    for (const auto& t : queue.TakeNext()) command += (command.empty() ? "" : ", ") + t.ToString();
    text += command;
  }
  return text;
}

TEST(X10SendQueue, TargetsBecomeTransmissionsFromTheDrivenLevel) {
  struct Step {
    int32_t steps;
    const char* expected;
  };
  // Each step is queued and drained before the next.
  const Step steps[] = {
      {22, "A1, A On"},                                           // from dark to full
      {11, "A1, A Dim 11"},                                       // relative from 22
      {5, "A1, A Dim 6"},   {15, "A1, A Bright 10"},   {15, ""},  // no change
      {0, "A1, A Off"},     {8, "A1, A On, A Dim 14"},            // from off: on (full), then down
  };
  X10SendQueue queue;
  for (const Step& step : steps) {
    queue.SetTarget(1, 1, step.steps);
    EXPECT_EQ(Drain(queue), step.expected) << "to " << step.steps;
    EXPECT_EQ(queue.DrivenSteps(1, 1), step.steps);
  }
}

TEST(X10SendQueue, FadesCollapseButFlashesAreKept) {
  X10SendQueue queue;
  queue.SetTarget(2, 3, 22);  // B3 on
  queue.SetTarget(1, 1, 4);
  queue.SetTarget(1, 1, 6);  // a fade: replaces the waiting dim level
  queue.SetTarget(1, 1, 9);
  queue.SetTarget(2, 3, 0);   // B3 off again: a flash, kept
  queue.SetTarget(1, 1, 22);  // the end of the fade replaces it too
  queue.SetTarget(1, 1, 21);  // after full, a new dim level queues anew
  EXPECT_EQ(queue.Depth(), 4u);
  EXPECT_EQ(Drain(queue), "B3, B On | A1, A On | B3, B Off | A1, A Dim 1");
}

TEST(X10SendQueue, ADimLevelBackWhereTheUnitIsSendsNothing) {
  X10SendQueue queue;
  queue.SetTarget(1, 1, 10);
  Drain(queue);
  queue.SetTarget(1, 1, 12);
  queue.SetTarget(1, 1, 10);  // replaces 12 with the level already driven
  EXPECT_EQ(Drain(queue), "");
  queue.SetTarget(0, 1, 5);  // out of range: ignored
  queue.SetTarget(1, 17, 5);
  EXPECT_TRUE(queue.Empty());
}

TEST(X10SendQueue, LevelsMapToTheNearestDimStep) {
  EXPECT_EQ(X10StepsForLevel(0), 0);
  EXPECT_EQ(X10StepsForLevel(5), 0);
  EXPECT_EQ(X10StepsForLevel(6), 1);
  EXPECT_EQ(X10StepsForLevel(128), 11);
  EXPECT_EQ(X10StepsForLevel(249), 21);
  EXPECT_EQ(X10StepsForLevel(255), 22);
}

}  // namespace
}  // namespace tav
