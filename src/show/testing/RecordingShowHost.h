#pragma once
// Test double of the ShowPlayerHost: writes every log line, tray notice,
// status report and restart check to a Timeline, as
//   "log 1 Starting <main.tseq>"   (level, text, the sequence's file name)
//   "tray start <main.tseq> 3"     (file name, section)
//   "tray stop <main.tseq>", "tray status", "host restart check".
// Trace lines (level 0) are recorded only when asked for. The playback-file
// creator finds nothing unless told a replacement. Hooks let a test act
// where the real host would (ending the program for a restart, say).

#include <cstdint>
#include <functional>
#include <map>
#include <string>

#include "show/ShowPlayerHost.h"
#include "show/testing/Timeline.h"

namespace tav {

class RecordingShowHost : public ShowPlayerHost {
 public:
  explicit RecordingShowHost(Timeline& timeline) : m_timeline(timeline) {}

  void LogMessage(int32_t level, const std::string& szText,
                  const SequenceIdentity* seqInfo = nullptr) override;
  void SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) override;
  void SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) override;
  std::string CreatePlaybackFileIfNeeded(const std::string& szFilename) override;
  void SendStatusToTAVTray(bool boolForce) override;
  void ShutdownForRestartIfNecessary() override;

  // Level 0 lines are composed and dropped by the real log; record them too.
  void SetRecordTrace(bool record) { m_recordTrace = record; }
  // What CreatePlaybackFileIfNeeded answers for a name.
  void SetPlaybackFile(const std::string& name, const std::string& file) {
    m_playback[name] = file;
  }

  std::function<void()> onStatus;
  std::function<void()> onRestartCheck;
  int StatusCount() const { return m_statusCount; }
  int RestartChecks() const { return m_restartChecks; }

 private:
  Timeline& m_timeline;
  bool m_recordTrace = false;
  std::map<std::string, std::string> m_playback;
  int m_statusCount = 0;
  int m_restartChecks = 0;
};

}  // namespace tav
