// Inputs at run time: registering the startup and interactive triggers with
// the I/O control, clearing them, and reacting to an input event. Part of
// ShowPlayer.

#include "show/ShowPlayer.h"
#include "show/TriggerFunctions.h"
#include "support/Error.h"

namespace tav {

void ShowPlayer::RegisterStartupTrigger() {
  const Show& show = *m_currentShow;
  const auto& trigger = show.StartupTrigger();
  if (show.StartupType() == 0 || !trigger) return;
  Log(1, "Registering startup trigger");
  m_CIO->RegisterInput(trigger->Network(), trigger->UnitId(), trigger->InputNumber(),
                       trigger->Name());
  m_state.RegistrationsActive = true;
}

void ShowPlayer::RegisterInteractiveTriggers() {
  bool logged = false;
  for (const InteractiveEntry& entry : m_state.InteractiveList) {
    for (const InteractiveSet& set : entry.sets) {
      const auto& trigger = set.binding->Trig();
      if (!trigger) continue;
      if (!logged) {
        Log(1, "Registering interactive triggers");
        logged = true;
        m_state.RegistrationsActive = true;
      }
      m_CIO->RegisterInput(trigger->Network(), trigger->UnitId(), trigger->InputNumber(),
                           trigger->Name());
    }
  }
  m_state.TriggersRegistered = true;
}

// Drops every registration. With none active there is nothing to drop, and
// the control is left alone.
void ShowPlayer::ClearTriggers() {
  if (!m_state.RegistrationsActive) return;
  Log(1, "Clearing triggers");
  m_state.RegistrationsActive = false;
  if (m_CIO) m_CIO->ClearInputs();
}

void ShowPlayer::m_CIO_InputEvent(const ChannelInputEvent& input) {
  try {
    // Nothing reacts before a show runs or once it winds down.
    if (!m_currentShow || m_state.ShuttingDown) return;
    std::shared_ptr<Trigger> trigger =
        NewTrigger(input.network, input.unitId, input.inputNumber, input.name);
    if (!trigger) return;
    if (trigger->Equals(m_currentShow->StartupTrigger())) {
      Log(1, "Startup trigger detected");
      if (!m_state.BackgroundReleased) {
        m_state.BackgroundReleased = true;
        ReleaseBackground();
      }
      m_state.MainReleased = true;
      // The startup trigger is not watched again.
      if (!m_state.TriggersRegistered) ClearTriggers();
    } else {
      Log(1, "Trigger detected: " + trigger->Name());
    }
    // The same input may also be bound to interactive sequences.
    if (m_state.MainReleased) ReactToTrigger(*trigger);
  } catch (const Error& e) {
    Log(3, "m_CIO_InputEvent Error: " + e.Description());
  } catch (const std::exception& e) {
    Log(3, "m_CIO_InputEvent Error: " + std::string(e.what()));
  }
  Wake();
}

// Every binding whose trigger matches reacts: an independent group stops
// its playing sequences and starts all of the binding's together; any other
// group queues the binding's next sequence in its round robin.
void ShowPlayer::ReactToTrigger(const Trigger& trigger) {
  for (InteractiveEntry& entry : m_state.InteractiveList) {
    for (InteractiveSet& set : entry.sets) {
      const auto& bound = set.binding->Trig();
      if (!bound || !bound->Equals(trigger)) continue;
      if (entry.group->Independent()) {
        for (const SequenceRef& playing : m_state.PlayingList) {
          if (playing->Group() == entry.group) playing->StopPlay();
        }
        for (int32_t k = 1; k <= set.sequences.Count(); ++k) {
          Queue(set.sequences, k, false, nullptr);
        }
      } else {
        Queue(set.sequences, set.binding->RoundRobinIndex() + 1, false, set.binding);
      }
    }
  }
}

}  // namespace tav
