#pragma once
// The X10 commands waiting for the power line. X10 carries one or two
// commands a second while a sequence may change a lamp forty times a
// second, so level changes queue up here and leave in order, delayed but
// never lost: a flash (on, then off) always reaches the lamp.
//
// Each entry is a unit's target level in dim steps (0 off, 22 full). A dim
// level still waiting is replaced by the unit's next target, so a fade
// collapses into its latest step; an on or an off is never replaced, so it
// reaches the lamp however soon the next change follows. A target equal to
// what the unit will already be at is dropped.
//
// X10 dims relative to the lamp's level, so the queue keeps the level each
// unit was last driven to (every lamp is taken as off when the network
// opens) and turns a target into transmissions from there:
// an address, then Off, On, or Dim/Bright by the difference (a lamp that was
// off is first switched on, which brings it to full, then dimmed).
//
// Pure: no I/O. Owned by the X10 transmitter.

#include <cstddef>
#include <cstdint>
#include <deque>
#include <vector>

#include "suite/channelio/serial/X10Codes.h"

namespace tav {

// A level 0-255 in dim steps 0-22 (nearest step).
int32_t X10StepsForLevel(uint8_t level);

class X10SendQueue {
 public:
  // Asks for unit `unit` of house `house` (both 1-16) to go to `steps`
  // (0-22). Out-of-range houses and units are ignored.
  void SetTarget(int32_t house, int32_t unit, int32_t steps);
  bool Empty() const { return m_entries.empty(); }
  size_t Depth() const { return m_entries.size(); }

  // Takes the oldest entry and returns the transmissions that bring its unit
  // there, counting the unit as being there from now on. Empty when the
  // queue is.
  std::vector<X10Transmission> TakeNext();

  // The level a unit was last driven to, 0-22 (-1 out of range).
  int32_t DrivenSteps(int32_t house, int32_t unit) const;

 private:
  struct Entry {
    int32_t house;
    int32_t unit;
    int32_t steps;
  };
  static size_t Index(int32_t house, int32_t unit) {
    return static_cast<size_t>((house - 1) * 16 + (unit - 1));
  }
  // The level the unit will be at once everything queued for it has left.
  int32_t ExpectedSteps(int32_t house, int32_t unit) const;

  std::deque<Entry> m_entries;
  std::vector<int32_t> m_driven = std::vector<int32_t>(256, 0);
};

}  // namespace tav
