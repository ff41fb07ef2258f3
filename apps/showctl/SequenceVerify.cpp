// showctl sequence verify: read every block and every frame of a sequence,
// which inspect does not, and name the first damage. FSEQ files and exports
// are read a block at a time, so a file of any length is checked with a few
// megabytes; a plain sequence is parsed whole with its subsequences.

#include <fmt/format.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <iostream>

#include "CommandRegistry.h"
#include "SequenceCommands.h"
#include "suite/seqlib/CompressedSequenceReader.h"
#include "suite/seqlib/FseqConversion.h"
#include "support/Error.h"

namespace tav::showctl {
namespace {

// At most a few progress updates a second, on one line of standard error.
class Progress {
 public:
  Progress(bool shown, size_t total) : m_shown(shown), m_total(total) {}
  ~Progress() {
    if (m_printed && m_terminal) std::fprintf(stderr, "\r\033[K");
  }
  void Update(size_t done) {
    if (!m_shown || m_total == 0) return;
    auto now = std::chrono::steady_clock::now();
    if (m_printed && now - m_last < std::chrono::milliseconds(250)) return;
    m_last = now;
    m_printed = true;
    std::fprintf(stderr, "%sverifying: %3zu%% (frame %zu of %zu)%s", m_terminal ? "\r" : "",
                 done * 100 / m_total, done, m_total, m_terminal ? "" : "\n");
    std::fflush(stderr);
  }

 private:
  bool m_shown;
  bool m_terminal = ::isatty(STDERR_FILENO) != 0;
  size_t m_total;
  bool m_printed = false;
  std::chrono::steady_clock::time_point m_last;
};

// Files with fewer frames than this end before a progress line helps.
constexpr size_t kProgressFrames = 2000;

// The reader's words without the error's kind and the file name, which the
// line says already.
std::string Reason(const tav::Error& e, const std::string& file) {
  std::string text = e.Description();
  for (const std::string& prefix : {std::string("Invalid file format: "), file + ": "}) {
    if (text.compare(0, prefix.size(), prefix) == 0) text.erase(0, prefix.size());
  }
  return text;
}

std::string Megabytes(uint64_t bytes) {
  return fmt::format("{:.1f} MB", bytes / 1e6);
}

}  // namespace

void Verify(const SequenceOptions& o) {
  auto library = MakeSequenceLibrary(o);
  std::string format = library->FormatOf(o.file);
  if (format == "plain") {
    try {
      auto compiled = library->LoadCompiled(o.file);
      std::cout << fmt::format(
          "{}: OK (plain sequence: {} effects, {} frames; every subsequence found and read)\n",
          o.file, compiled->effects.size(), compiled->TimelineFrameCount());
    } catch (const tav::Error& e) {
      throw CommandFailed(fmt::format("{}: damaged: {}", o.file, Reason(e, o.file)));
    }
    return;
  }
  auto stream = library->OpenStreamed(o.file);
  size_t total = 0;
  for (const auto& group : stream->Groups()) total += group.frameCount;
  Progress progress(o.progress || (::isatty(STDERR_FILENO) != 0 && total >= kProgressFrames),
                    total);
  size_t done = 0;
  uint64_t levels = 0;
  try {
    while (const uint8_t* frame = stream->NextFrame()) {
      (void)frame;
      levels += stream->Groups()[stream->GroupIndex()].FrameBytes();
      if (++done % 64 == 0) progress.Update(done);
    }
  } catch (const tav::Error& e) {
    std::string where =
        stream->Groups().size() > 1
            ? fmt::format("frame {} of track group {}", stream->FrameIndex(), stream->GroupIndex())
            : fmt::format("frame {} of {}", stream->FrameIndex(), total);
    throw CommandFailed(fmt::format("{}: damaged at {}: {}", o.file, where, Reason(e, o.file)));
  }
  std::string what = format == "fseq" ? "FSEQ file" : "compressed export";
  std::cout << fmt::format("{}: OK ({}: every frame read, {} frames, {} of levels)\n", o.file, what,
                           done, Megabytes(levels));
}

}  // namespace tav::showctl
