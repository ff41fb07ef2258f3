#include "show/MediaGlue.h"

#include <limits>

#include "support/Error.h"
#include "support/Numbers.h"

namespace tav {

int32_t MediaPositionMs(double seconds) {
  double ms = RoundHalfEven(seconds * 1000.0);
  if (!(ms >= 0)) return 0;  // also NaN
  if (ms > std::numeric_limits<int32_t>::max()) return std::numeric_limits<int32_t>::max();
  return static_cast<int32_t>(ms);
}

MediaGlue::MediaGlue(const Settings& settings) {
  m_video.AudioOnly = settings.AudioOnly();
  m_video.DisplayVideos = settings.DisplayVideos();
  m_video.DisplayVisualizations = settings.DisplayVisualizations();
  m_video.FullScreenVideo = settings.FullScreenVideo();
  m_video.MonitorX = settings.MonitorX();
  m_video.MonitorY = settings.MonitorY();
}

void MediaGlue::SetControls(MediaPlayer* player, MessageLog* log) {
  m_WMP = player;
  m_log = log;
}

void MediaGlue::StartMedia(const std::shared_ptr<SequencePlayInfo>& item, const std::string& path) {
  if (!m_WMP) throw errors::ObjectNotSet("MediaGlue.StartMedia");
  m_WMP->OpenMedia(path);
  item->InitMusicSync(MediaPositionMs(m_WMP->CurrentPosition()));
  m_mediaSequence = item;
}

bool MediaGlue::KeepInStep(SequencePlayInfo& item) {
  if (m_WMP->PlayState() == kMediaStopped) {
    item.StopPlay();
    return true;
  }
  item.SyncToMusic(MediaPositionMs(m_WMP->CurrentPosition()));
  return false;
}

void MediaGlue::SequenceEnded(const SequencePlayInfo* item) {
  if (!IsMediaSequence(item)) return;
  m_mediaSequence.reset();
  // The music goes with its lights.
  if (m_WMP && m_WMP->PlayState() != kMediaStopped) m_WMP->Stop();
}

void MediaGlue::OnPlayStateChange(int32_t newState) {
  if (newState != kMediaPlaying || !m_WMP) return;
  bool video = m_WMP->CurrentMediaItemInfo("MediaType") == "video";
  bool show = video ? m_video.DisplayVideos : m_video.DisplayVisualizations;
  // Audio only: the sound plays and no window ever opens.
  if (show && !m_video.AudioOnly) {
    ShowVideoForm();
  } else {
    HideVideoForm();
  }
}

void MediaGlue::OnMediaError() {
  std::string text = MediaErrorText();
  if (m_mediaSequence) m_mediaSequence->SetErrorText(text);
  // Logged even when no sequence is bound any more: a file that cannot be
  // played is worth knowing about whenever its error arrives.
  if (m_log)
    m_log->LogMessage(3, "WINDOWS MEDIA PLAYER ERROR (" + text + "): ", m_mediaSequence.get());
}

std::string MediaGlue::MediaErrorText() {
  std::string text = "Error playing media file";
  try {
    int32_t count = m_WMP->ErrorCount();
    if (count > 0) {
      text += ": ";
      for (int32_t i = 0; i < count; ++i) {
        if (i > 0) text += " / ";
        text += m_WMP->ErrorDescription(i);
      }
    }
    m_WMP->ClearErrorQueue();
  } catch (...) {
    text = "Unexpected error playing media file";
  }
  return text;
}

void MediaGlue::ShowVideoForm() {
  m_WMP->ShowVideoForm(m_video.MonitorX, m_video.MonitorY);
  m_WMP->SetFullScreen(m_video.FullScreenVideo);
  m_formShown = true;
}

void MediaGlue::HideVideoForm() {
  if (!m_WMP || m_formShown == false) return;
  m_WMP->HideVideoForm();
  m_formShown = false;
}

}  // namespace tav
