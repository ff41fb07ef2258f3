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

TAV_FUZZ_TARGET({
  std::shared_ptr<tav::Show> show = tav::ShowFromText(input);
  if (show) {
    std::string first;
    try {
      first = tav::ShowToText(show);
    } catch (const tav::Error&) {
      std::abort();
    }
    std::shared_ptr<tav::Show> again;
    try {
      again = tav::ShowFromText(first);
    } catch (const tav::Error&) {
      std::abort();
    }
    if (!again || tav::ShowToText(again) != first) std::abort();
    if (!show->HasSameContents(again)) std::abort();
  }
})
