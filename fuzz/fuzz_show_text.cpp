// The show reader on arbitrary text: fails only with tav::Error, and the text
// a read show writes is canonical, so reading and writing it again gives the
// same text.
//
// The first write may legitimately differ from the input: numbers are
// normalised (" 2.7" becomes " 2"), older shorter files gain their default
// fields, unreadable groups and triggers are dropped and playlist types are
// forced by section. None of that can change an already canonical text, so the
// check starts from the first write. Every group that survives a read has at
// least one binding with at least one name, so a read show can always be
// written; a failure there is a fault as well.

#include <cstdlib>

#include "FuzzCommon.h"
#include "show/ShowFunctions.h"

namespace {

// Everything after a successful read must succeed.
void CheckCanonical(const std::shared_ptr<tav::Show>& show) {
  try {
    std::string first = tav::ShowToText(show);
    std::shared_ptr<tav::Show> again = tav::ShowFromText(first);
    if (!again || tav::ShowToText(again) != first) std::abort();
    if (!show->HasSameContents(again)) std::abort();
  } catch (const tav::Error&) {
    std::abort();
  }
}

}  // namespace

TAV_FUZZ_TARGET({
  std::shared_ptr<tav::Show> show = tav::ShowFromText(input);
  if (show) CheckCanonical(show);
})
