#pragma once
// How long a media file plays, read from the file itself where that needs
// no decoding: the header of a WAV file (RIFF, PCM or any other coding that
// states its byte rate), the STREAMINFO block of a FLAC file, the first
// frames of an MP3 file (a Xing/Info or VBRI frame count, else the constant
// bit rate) and the last page of an Ogg Vorbis or Opus file. Other formats
// (AAC, WMA, video) would take a media library, so their length is reported
// as unknown and the simulation lets the sequence's own length decide. A
// file that is missing or cannot be opened is reported as such: the real
// media player cannot play it either.
//
// Free functions on the sequence library's FileSystem port; nothing is
// written, and at most the first and the last kHeadBytes of a file are read.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "suite/seqlib/FileSystem.h"

namespace tav::simulation {

struct MediaLength {
  enum class Found {
    kSeconds,     // `seconds` holds the length, read from the header `source` names
    kUnknown,     // a file that exists but whose length is not read cheaply
    kMissing,     // no such file
    kUnreadable,  // it cannot be opened, or it is empty
  };
  Found found = Found::kUnknown;
  double seconds = 0;
  // "WAV header", "MP3 frames"; for kUnknown the kind of file ("MP3 file");
  // for kUnreadable the reason.
  std::string source;
};

inline constexpr size_t kHeadBytes = 64 * 1024;

// The length of a WAV file from its first bytes (`head`) and its size: the
// data chunk's size over the byte rate (a data chunk that claims more than
// the file holds, as a stream's does, counts to the end of the file).
// Nothing when it is no WAV file or its header cannot be read.
std::optional<double> WavSeconds(std::string_view head, uint64_t fileSize);
// The length of a FLAC file from its STREAMINFO block (after an ID3v2 tag,
// if any). Nothing when it is no FLAC file or it does not state its length.
std::optional<double> FlacSeconds(std::string_view head);

// The length of an MP3 file from its first bytes and its size (the first
// frame's bit rate holds for the whole file when no frame count is given).
// Nothing when no MPEG audio frame is found.
std::optional<double> Mp3Seconds(std::string_view head, uint64_t fileSize);
// The length of an Ogg Vorbis or Opus file from its first bytes (the
// identification header) and its last (the final page's position).
std::optional<double> OggSeconds(std::string_view head, std::string_view tail);

MediaLength ProbeMediaLength(const FileSystem& files, const std::string& path);

// "2:13.4", "1:02:03.0", "0:00.5".
std::string LengthText(double seconds);

}  // namespace tav::simulation
