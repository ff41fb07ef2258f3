#pragma once
// The subcommands of "showctl sequence", one file each (SequenceInspect,
// SequenceVerify, SequenceConvert, SequenceLevels); cmd_sequence.cpp
// registers them. They share the options and the sequence library made
// for the user's folders.

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "suite/seqlib/FileSequenceLibrary.h"

namespace tav::showctl {

struct SequenceOptions {
  std::string file;
  std::string output;
  std::string to;
  std::string folder;
  // levels
  std::string at;
  std::optional<int64_t> frame;
  std::string channels;
  std::optional<int32_t> universe;
  bool json = false;
  // verify
  bool progress = false;
};

std::shared_ptr<FileSequenceLibrary> MakeSequenceLibrary(const SequenceOptions& o);
// "1:30.250 (90250 ms)".
std::string Duration(int64_t ms);
// "1:30.250".
std::string ClockTime(int64_t ms);

void Inspect(const SequenceOptions& o);
void Verify(const SequenceOptions& o);
void Convert(const SequenceOptions& o);
void Levels(const SequenceOptions& o);

}  // namespace tav::showctl
