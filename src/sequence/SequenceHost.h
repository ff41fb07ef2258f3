#pragma once
// What a playing sequence asks of the program that hosts it: the log, the
// tray's start and stop notices, and a playable file for a name that does not
// exist as given. The host form implements it; tests stand in a recorder.

#include <string>

#include "ports/MessageLog.h"

namespace tav {

class SequenceHost : public MessageLog {
 public:
  virtual void SendSequenceStartToTAVTray(const SequenceIdentity& seqInfo) = 0;
  virtual void SendSequenceStopToTAVTray(const SequenceIdentity& seqInfo) = 0;
  // The path of a playable file made from a sequence name that does not
  // exist as given, or "" when none could be made.
  virtual std::string CreatePlaybackFileIfNeeded(const std::string& szFilename) = 0;
};

}  // namespace tav
