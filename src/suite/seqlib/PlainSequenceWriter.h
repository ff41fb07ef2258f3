#pragma once
// Writes the plain format (docs/sequence-format.md) piece by piece: the
// metadata and the channels with their effects at once, then the frames of
// each track group as they come, one line of hexadecimal levels per frame.
// A group of several tracks is written as one frame entry with a list of
// address runs, so frames never have to be turned into tracks: a sequence of
// any length is written holding one frame and a small buffer.
//
// The caller owns the file and commits it once Finish has returned.
// Throws tav::Error.

#include <cstdint>
#include <string>
#include <vector>

#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/SequenceData.h"
#include "suite/seqlib/StreamedSequence.h"
#include "suite/seqlib/TrackGroup.h"

namespace tav {

class PlainSequenceWriter {
 public:
  // `head.tracks` is not written; the groups say what frames follow.
  PlainSequenceWriter(WritableFile& out, const SequenceData& head, std::vector<TrackGroup> groups);

  const std::vector<TrackGroup>& Groups() const { return m_groups; }
  // The next frame: the current group's FrameBytes() levels.
  void AddFrame(const uint8_t* levels);
  // After the last frame of the last group.
  void Finish();
  size_t MemoryHeld() const { return m_text.capacity(); }

 private:
  void OpenGroup();
  void CloseGroup();
  void Flush(bool always);

  WritableFile& m_out;
  std::vector<TrackGroup> m_groups;
  std::string m_subsequences;  // written last
  size_t m_group = 0;
  uint32_t m_frame = 0;
  bool m_groupOpen = false;
  std::string m_text;
};

// The plain form of a stream, not read from yet. Subsequences are already
// merged into a compiled sequence, so the result names none.
void WritePlainSequence(StreamedSequence& source, WritableFile& out);

}  // namespace tav
