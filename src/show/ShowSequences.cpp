// Starting queued sequences, servicing the playing ones (music sync and the
// event pump) and ending them. Part of ShowPlayer.

#include <algorithm>

#include "show/ShowPlayer.h"
#include "support/Error.h"

namespace tav {

// ---- Starting --------------------------------------------------------------

void ShowPlayer::NoteFailedStart(const SequencePlayInfo& item) {
  Log(3, "ERROR WITH SEQUENCE (" + item.ErrorText() + ")");
  // A musical piece that cannot start is followed at once by the next one,
  // without its clean-up or the pause.
  if (item.PlayType() == 5 || item.PlayType() == 6) {
    m_state.MusicalPhase = kMusicalChoose;
    m_state.DelayStarted = false;
  }
}

void ShowPlayer::StartQueued() {
  SequenceRef item = m_state.PlayQueue.Item(1);
  m_state.PlayQueue.Remove(1);
  std::shared_ptr<TriggeredSequences> bumpee = item->RoundRobinBumpee();
  item->SetRoundRobinBumpee(nullptr);

  if (item->ErrorOccurred()) {
    NoteFailedStart(*item);
    return;
  }
  if (item->PlayType() == 2 && !ResolveInteractiveConflicts(item)) return;

  m_networks.OpenFamiliesFor(item->UsesTAV(), false, false);
  m_state.PlayingList.Add(item);
  // The round robin moves only when its sequence really starts.
  if (bumpee) bumpee->BumpRoundRobinIndex();

  item->InitializeForPlay();
  if (item->ErrorOccurred()) {
    // Preparation failed on this start (a file that cannot be loaded): it
    // never plays, and the section goes on with its next item.
    m_state.PlayingList.Remove(item.get());
    NoteFailedStart(*item);
    return;
  }
  m_networks.OpenFamiliesFor(item->UsesTAV(), item->UsesX10(), item->UsesFennick());
  item->ExecuteShellCommand(m_services.shellCommands);
  std::string media = item->MediaFilename();
  if (!media.empty()) m_media.StartMedia(item, media);
  Log(1, "Starting", item.get());
  item->StartPlay();
}

// An interactive sequence against the playing ones of its group: a group
// that cannot be interrupted ignores the trigger while one of its sequences
// plays; one that can is interrupted (the same file, or any of its
// sequences unless the group is independent). A new sequence with media
// takes the player from the one that has it. False when the new sequence is
// dropped.
bool ShowPlayer::ResolveInteractiveConflicts(const SequenceRef& item) {
  const auto& group = item->Group();
  std::vector<SequenceRef> toStop;
  for (const SequenceRef& playing : m_state.PlayingList) {
    if (playing->PlayType() != 2 || !group || playing->Group() != group) continue;
    if (!group->Interruptible()) return false;
    if (playing->Filename() == item->Filename() || !group->Independent()) {
      toStop.push_back(playing);
    }
  }
  for (const SequenceRef& playing : toStop) StopAndEnd(playing);

  std::string media;
  try {
    media = item->MediaFilename();
  } catch (const Error&) {
    // Its preparation will report the load failure.
  }
  const SequenceRef& mediaSequence = m_media.MediaSequence();
  if (!media.empty() && mediaSequence && mediaSequence != item) StopAndEnd(mediaSequence);
  return true;
}

// Stops a playing sequence and services it at once, so that it has ended
// (its lights put out) before another takes its place.
void ShowPlayer::StopAndEnd(const SequenceRef& item) {
  SequenceRef keep = item;  // the lists may hold the last reference
  keep->StopPlay();
  ServiceSequence(keep);
}

// ---- Servicing -------------------------------------------------------------

bool ShowPlayer::ServiceSequence(const SequenceRef& item) {
  try {
    if (!item->ErrorOccurred() && item->SequencePlayState() != 0) {
      bool mediaStopped = false;
      if (m_media.IsMediaSequence(item.get())) mediaStopped = m_media.KeepInStep(*item);
      PumpEvents(*item);
      if (item->SequencePlayState() != 0 && !mediaStopped) return true;
    }
    EndSequence(item);
    return false;
  } catch (const std::exception& e) {
    // The next tick tries again; a sequence that keeps failing the same way
    // is reported once.
    std::string text = "ServicePlayingSequence Error: ";
    text += dynamic_cast<const Error*>(&e) ? static_cast<const Error&>(e).Description() : e.what();
    auto& last = m_serviceFailures[item.get()];
    if (last != text) {
      last = text;
      Log(3, text, item.get());
    }
    return m_state.PlayingList.Contains(item.get());
  }
}

// Hands every due event to the I/O control, for at most kPumpLimitMs, and
// seals each frame with its due tick: events due at the same tick form one
// frame.
void ShowPlayer::PumpEvents(SequencePlayInfo& item) {
  const uint32_t started = m_clock.TickCount();
  bool pending = false;
  uint32_t frameDue = 0;
  while (item.GetEvent(m_event)) {
    const PlayEvent& e = m_event;
    const bool levels =
        e.playEventType == kPlayEventLevels && (e.devType == kFamilyDMX || e.devType == kFamilyTAV);
    if (e.playEventType == kPlayEventEffect || levels) {
      if (pending && e.dueTick != frameDue) m_CIO->SendAccumulated(frameDue);
      pending = true;
      frameDue = e.dueTick;
      if (!levels) {
        m_CIO->OutputEffect(e.devType, e.lNetwork, e.byteUnit, e.lCircuit, e.szChannelName,
                            e.effectType, e.lDuration, e.lStartIntensity, e.lEndIntensity,
                            e.lPriority, e.dueTick);
      } else {
        auto count = static_cast<int32_t>(std::min<size_t>(
            static_cast<size_t>(std::max(e.nIntensityBlobCount, 0)), e.byteIntensityBlob.size()));
        if (e.devType == kFamilyDMX) {
          m_CIO->OutputDMXLevels(e.lNetwork, e.nIntensityBlobStartAddress, count,
                                 e.byteIntensityBlob.data(), e.dueTick);
        } else {
          m_CIO->OutputTAVLevels(e.lNetwork, e.byteUnit, e.nIntensityBlobStartAddress, count,
                                 e.byteIntensityBlob.data(), e.dueTick);
        }
      }
    }
    if (static_cast<uint32_t>(m_clock.TickCount() - started) >= kPumpLimitMs) break;
  }
  if (pending) m_CIO->SendAccumulated(frameDue);
}

// ---- Ending ----------------------------------------------------------------

void ShowPlayer::EndSequence(const SequenceRef& item) {
  SequenceRef keep = item;
  m_media.SequenceEnded(keep.get());
  m_host->SendSequenceStopToTAVTray(*keep);
  m_state.PlayingList.Remove(keep.get());
  m_serviceFailures.erase(keep.get());
  Log(1, "Ending", keep.get());
}

}  // namespace tav
