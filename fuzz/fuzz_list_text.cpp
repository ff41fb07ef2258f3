// The list reader on arbitrary text: fails only with tav::Error, and what it
// reads writes back to a text that reads the same fields again.

#include <cstdlib>

#include "FuzzCommon.h"
#include "support/Serialize.h"

TAV_FUZZ_TARGET({
  tav::TextArray fields = tav::ListFromText(input, 1);
  if (fields.IsSized()) {
    // Every field is a raw text without a depth-0 comma, so a list written
    // from the fields splits back into the same number of fields or fails.
    for (int32_t i = fields.LBound(); i <= fields.UBound(); ++i) {
      tav::UnescapeText(fields[i]);
      tav::BoolFromText(fields[i]);
    }
  }
  if (tav::UnescapeText(tav::EscapeText(input)) != input) std::abort();
})
