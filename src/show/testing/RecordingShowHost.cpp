#include "show/testing/RecordingShowHost.h"

namespace tav {

namespace {
std::string BaseName(const std::string& path) {
  auto slash = path.find_last_of("/\\");
  return slash == std::string::npos ? path : path.substr(slash + 1);
}
}  // namespace

void RecordingShowHost::LogMessage(int32_t level, const std::string& szText,
                                   const SequenceIdentity* seqInfo) {
  if (level <= 0 && !m_recordTrace) return;
  std::string text = "log " + std::to_string(level) + " " + szText;
  if (seqInfo) text += " <" + BaseName(seqInfo->Filename()) + ">";
  m_timeline.Add(std::move(text));
}

void RecordingShowHost::SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) {
  m_timeline.Add("tray start <" + BaseName(seqInfo.Filename()) + "> " +
                 std::to_string(seqInfo.Section()));
}

void RecordingShowHost::SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) {
  m_timeline.Add("tray stop <" + BaseName(seqInfo.Filename()) + ">");
}

std::string RecordingShowHost::CreatePlaybackFileIfNeeded(const std::string& szFilename) {
  auto it = m_playback.find(szFilename);
  std::string file = it == m_playback.end() ? "" : it->second;
  m_timeline.Add("host playback file for " + szFilename + ": " + (file.empty() ? "none" : file));
  return file;
}

void RecordingShowHost::SendStatusToTAVTray(bool boolForce) {
  ++m_statusCount;
  m_timeline.Add(boolForce ? "tray status forced" : "tray status");
  if (onStatus) onStatus();
}

void RecordingShowHost::ShutdownForRestartIfNecessary() {
  ++m_restartChecks;
  m_timeline.Add("host restart check");
  if (onRestartCheck) onRestartCheck();
}

}  // namespace tav
