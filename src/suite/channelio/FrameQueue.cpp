#include "suite/channelio/FrameQueue.h"

#include "suite/channelio/Ticks.h"

namespace tav {

Frame& FrameQueue::FrameAt(uint32_t dueTick) {
  // Events come in due order, so the frame is nearly always the last one.
  auto it = m_frames.end();
  while (it != m_frames.begin() && TickBefore(dueTick, std::prev(it)->dueTick)) --it;
  if (it != m_frames.begin() && std::prev(it)->dueTick == dueTick) {
    Frame& frame = *std::prev(it);
    frame.sealed = false;
    return frame;
  }
  Frame fresh;
  if (!m_spare.empty()) {
    fresh = std::move(m_spare.back());
    m_spare.pop_back();
  }
  fresh.dueTick = dueTick;
  fresh.sealed = false;
  return *m_frames.insert(it, std::move(fresh));
}

void FrameQueue::AddLevels(FrameWrite::Kind kind, uint32_t dueTick, int32_t network, int32_t unit,
                           int32_t first, const uint8_t* levels, int32_t count) {
  if (count <= 0 || !levels) return;
  Frame& frame = FrameAt(dueTick);
  FrameWrite write;
  write.kind = kind;
  write.network = network;
  write.unit = unit;
  write.first = first;
  write.count = count;
  write.offset = frame.bytes.size();
  write.dueTick = dueTick;
  frame.bytes.insert(frame.bytes.end(), levels, levels + count);
  frame.writes.push_back(write);
}

void FrameQueue::AddEffect(uint32_t dueTick, const EffectCommand& effect) {
  Frame& frame = FrameAt(dueTick);
  FrameWrite write;
  write.kind = FrameWrite::Kind::kEffect;
  write.effect = effect;
  write.dueTick = dueTick;
  frame.writes.push_back(write);
}

void FrameQueue::SealAll() {
  for (Frame& frame : m_frames) frame.sealed = true;
}

std::optional<uint32_t> FrameQueue::NextSealedDue() const {
  if (m_frames.empty() || !m_frames.front().sealed) return std::nullopt;
  return m_frames.front().dueTick;
}

void FrameQueue::TakeDue(uint32_t now, std::vector<Frame>& due) {
  while (!m_frames.empty() && m_frames.front().sealed &&
         !TickBefore(now, m_frames.front().dueTick)) {
    due.push_back(std::move(m_frames.front()));
    m_frames.pop_front();
  }
}

void FrameQueue::TakeAllSealed(std::vector<Frame>& due) {
  while (!m_frames.empty() && m_frames.front().sealed) {
    due.push_back(std::move(m_frames.front()));
    m_frames.pop_front();
  }
}

std::optional<uint32_t> FrameQueue::LastDue() const {
  if (m_frames.empty()) return std::nullopt;
  return m_frames.back().dueTick;
}

void FrameQueue::Recycle(std::vector<Frame>& frames) {
  for (Frame& frame : frames) {
    frame.writes.clear();
    frame.bytes.clear();
    // A handful of spares covers a steady show; more would only hold memory.
    if (m_spare.size() < 4) m_spare.push_back(std::move(frame));
  }
  frames.clear();
}

void FrameQueue::Clear() {
  std::vector<Frame> all(std::make_move_iterator(m_frames.begin()),
                         std::make_move_iterator(m_frames.end()));
  m_frames.clear();
  Recycle(all);
}

}  // namespace tav
