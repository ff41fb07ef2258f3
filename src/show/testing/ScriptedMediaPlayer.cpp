#include "show/testing/ScriptedMediaPlayer.h"

#include <algorithm>
#include <cmath>

#include "support/Error.h"

namespace tav {

namespace {
std::string BaseName(const std::string& path) {
  auto slash = path.find_last_of("/\\");
  return slash == std::string::npos ? path : path.substr(slash + 1);
}
uint32_t ToMs(double seconds) {
  return seconds <= 0 ? 0 : static_cast<uint32_t>(std::llround(seconds * 1000.0));
}
}  // namespace

ScriptedMediaPlayer::ScriptedMediaPlayer(const Clock& clock, TimerService& timers,
                                         Timeline* timeline)
    : m_clock(clock), m_timeline(timeline) {
  m_events = timers.CreateTimer("mediaEvents", 0, true, [this] { Deliver(); });
}

void ScriptedMediaPlayer::Record(const std::string& text) {
  if (m_timeline) m_timeline->Add("media " + text);
}

uint32_t ScriptedMediaPlayer::ElapsedMs() const {
  return m_clock.TickCount() - m_openedAt;
}

void ScriptedMediaPlayer::Post(uint32_t delayMs, std::function<void()> raise) {
  m_pending.push_back({m_clock.TickCount() + delayMs, std::move(raise)});
  uint32_t now = m_clock.TickCount();
  uint32_t soonest = UINT32_MAX;
  for (const Pending& p : m_pending) soonest = std::min(soonest, p.dueTick - now);
  m_events->SetNextTickIn(soonest);
}

void ScriptedMediaPlayer::Deliver() {
  const uint32_t now = m_clock.TickCount();
  // In the order posted; an event raised while delivering waits its turn.
  std::vector<Pending> due;
  for (auto it = m_pending.begin(); it != m_pending.end();) {
    if (static_cast<int32_t>(it->dueTick - now) <= 0) {
      due.push_back(std::move(*it));
      it = m_pending.erase(it);
    } else {
      ++it;
    }
  }
  for (Pending& p : due) p.raise();
  if (!m_pending.empty()) {
    uint32_t soonest = UINT32_MAX;
    for (const Pending& p : m_pending) soonest = std::min(soonest, p.dueTick - now);
    m_events->SetNextTickIn(soonest);
  }
}

void ScriptedMediaPlayer::OpenMedia(const std::string& path) {
  m_file = BaseName(path);
  auto it = m_scripts.find(m_file);
  m_script = it == m_scripts.end() ? m_default : it->second;
  m_openedAt = m_clock.TickCount();
  m_stopped = false;
  uint64_t generation = ++m_generation;
  Record("OpenMedia(" + m_file + ")");
  if (!m_script.loadErrors.empty()) {
    m_endMs = UINT32_MAX;
    m_loadFailed = false;
    Post(0, [this, generation] {
      if (generation != m_generation) return;
      m_loadFailed = true;
      m_errors.insert(m_errors.end(), m_script.loadErrors.begin(), m_script.loadErrors.end());
      Record("event MediaError");
      if (m_onMediaError) m_onMediaError();
      Record("event PlayStateChange(1)");
      if (m_onPlayStateChange) m_onPlayStateChange(kMediaStopped);
    });
    return;
  }
  m_endMs = ToMs(m_script.durationSeconds);
  if (m_script.stopsAfterSeconds) m_endMs = std::min(m_endMs, ToMs(*m_script.stopsAfterSeconds));
  Post(0, [this, generation] {
    if (generation != m_generation) return;
    Record("event PlayStateChange(3)");
    if (m_onPlayStateChange) m_onPlayStateChange(kMediaPlaying);
  });
  Post(m_endMs, [this, generation] {
    if (generation != m_generation) return;
    Record("event PlayStateChange(8)");
    if (m_onPlayStateChange) m_onPlayStateChange(kMediaEnded);
    Record("event PlayStateChange(1)");
    if (m_onPlayStateChange) m_onPlayStateChange(kMediaStopped);
  });
}

void ScriptedMediaPlayer::Stop() {
  Record("Stop()");
  if (m_stopped) return;
  m_stopped = true;
  uint64_t generation = ++m_generation;
  Post(0, [this, generation] {
    if (generation != m_generation) return;
    Record("event PlayStateChange(1)");
    if (m_onPlayStateChange) m_onPlayStateChange(kMediaStopped);
  });
}

std::string ScriptedMediaPlayer::CurrentFile() const {
  return m_file;
}

std::string ScriptedMediaPlayer::CurrentMediaItemInfo(const std::string& attribute) const {
  if (attribute != "MediaType" || m_file.empty() || !m_script.loadErrors.empty()) return "";
  return m_script.mediaType;
}

double ScriptedMediaPlayer::CurrentPosition() const {
  if (m_file.empty() || m_stopped || !m_script.loadErrors.empty()) return 0.0;
  return std::min(ElapsedMs(), m_endMs) / 1000.0;
}

int32_t ScriptedMediaPlayer::PlayState() const {
  if (m_file.empty() || m_stopped) return kMediaStopped;
  if (!m_script.loadErrors.empty()) return m_loadFailed ? kMediaStopped : kMediaTransitioning;
  return ElapsedMs() >= m_endMs ? kMediaStopped : kMediaPlaying;
}

void ScriptedMediaPlayer::SetFullScreen(bool value) {
  Record(std::string("SetFullScreen(") + (value ? "true" : "false") + ")");
}

int32_t ScriptedMediaPlayer::ErrorCount() const {
  if (m_failQueue) throw Error(5, "ScriptedMediaPlayer.ErrorCount", "the error queue failed");
  return static_cast<int32_t>(m_errors.size());
}

std::string ScriptedMediaPlayer::ErrorDescription(int32_t index) const {
  if (index < 0 || index >= static_cast<int32_t>(m_errors.size())) {
    throw errors::SubscriptOutOfRange("ScriptedMediaPlayer.ErrorDescription");
  }
  return m_errors[static_cast<size_t>(index)];
}

void ScriptedMediaPlayer::ClearErrorQueue() {
  m_errors.clear();
}

void ScriptedMediaPlayer::ShowVideoForm(int32_t x, int32_t y) {
  m_formShown = true;
  Record("ShowVideoForm(" + std::to_string(x) + ", " + std::to_string(y) + ")");
}

void ScriptedMediaPlayer::HideVideoForm() {
  m_formShown = false;
  Record("HideVideoForm()");
}

void ScriptedMediaPlayer::RaiseMediaError(const std::vector<std::string>& descriptions) {
  m_errors.insert(m_errors.end(), descriptions.begin(), descriptions.end());
  Record("event MediaError");
  if (m_onMediaError) m_onMediaError();
}

void ScriptedMediaPlayer::SetOnPlayStateChange(std::function<void(int32_t newState)> handler) {
  m_onPlayStateChange = std::move(handler);
}

void ScriptedMediaPlayer::SetOnMediaError(std::function<void()> handler) {
  m_onMediaError = std::move(handler);
}

}  // namespace tav
