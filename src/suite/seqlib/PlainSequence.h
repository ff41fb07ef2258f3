#pragma once
// The plain sequence format: a JSON text of our own (docs/sequence-format.md)
// that people and tools can write. Parsing checks every field and reports
// the first problem as a tav::Error naming the file and the JSON path
// ("show.json: channels[2].effects[0].to: intensity 140 is outside 0-100").

#include <functional>
#include <string>
#include <string_view>

#include "suite/seqlib/SequenceData.h"

namespace tav {

constexpr int kPlainSequenceVersion = 1;

// Whether the text looks like a plain sequence (a JSON object), judged by
// content so that the file name does not matter.
bool LooksLikePlainSequence(std::string_view text);

// `name` is used in error messages only. `progress`, when given, is called
// now and then while a long text is parsed.
SequenceData ParsePlainSequence(std::string_view text, const std::string& name,
                                const std::function<void()>& progress = {});
std::string WritePlainSequence(const SequenceData& data);

}  // namespace tav
