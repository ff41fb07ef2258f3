#pragma once
// Values typed on showctl's command line, read strictly: a value that is not
// exactly what the option takes fails with CommandFailed before any file is
// touched, naming the option when `what` is given ("--speed: \"fast\" is not
// a whole number of 32 bits").

#include <cstdint>
#include <string>
#include <string_view>

namespace tav::showctl {

// true/yes/on/1 and false/no/off/0, in any letter case.
bool ParseBoolean(const std::string& text, std::string_view what = {});
// A whole number of 32 bits, written in decimal.
int32_t ParseLong(const std::string& text, std::string_view what = {});

}  // namespace tav::showctl
