#pragma once
// What the `showctl network` commands share: options kept as typed until
// they are read, the steps that apply them to one part of the preferences,
// and the show-or-change flow every command follows (read and warn, or
// change in one transaction, warn, and show the result).
//
// Each Add* reads an option's value at once, so that a bad value fails
// before the settings file is opened, and records how to apply it.

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "ArgumentValues.h"
#include "CommandRegistry.h"
#include "NetworkEdit.h"
#include "config/NetworkPreferences.h"
#include "platform/FileRegistryStore.h"

namespace tav::showctl {

// Options of the `network` group itself.
struct NetworkCommon {
  std::string file;  // settings file; empty: the usual one
};

// Ends every changing command's help.
extern const char* const kNetworkFooter;

using Option = std::optional<std::string>;
template <typename T>
using Steps = std::vector<std::function<void(T&)>>;

template <typename T, typename Setter>
void AddLong(Steps<T>& steps, const Option& text, const char* option, Setter set) {
  if (!text) return;
  int32_t value = ParseLong(*text, option);
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T, typename Setter>
void AddBoolean(Steps<T>& steps, const Option& text, const char* option, Setter set) {
  if (!text) return;
  bool value = ParseBoolean(*text, option);
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T, typename Setter>
void AddText(Steps<T>& steps, const Option& text, Setter set) {
  if (!text) return;
  std::string value = *text;
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T, typename Setter>
void AddTransport(Steps<T>& steps, const Option& text, const char* option, Setter set) {
  if (!text) return;
  DMXTransport value;
  if (!DMXTransportFromName(*text, value)) {
    throw CommandFailed(fmt::format(
        "{}: \"{}\" is not a transport (E1.31, ArtNet, USBPro or OpenDMX)", option, *text));
  }
  steps.push_back([value, set](T& target) { std::invoke(set, target, value); });
}

template <typename T>
void Apply(const Steps<T>& steps, T& target) {
  for (const auto& step : steps) step(target);
}

void Warn(const std::string& text);

// The preferences as the player would read them; what cannot be read and
// what is out of range is warned about on standard error.
NetworkPreferences ReadAndWarn(FileRegistryStore& store);

using View = std::function<std::string(const NetworkPreferences&)>;

// Shows one part when no option was given (`change` false), else changes it
// and shows the result.
void ShowOrChange(const NetworkCommon& common, bool change,
                  const std::function<void(NetworkPreferences&)>& apply, const View& view,
                  RangeCheck check = RangeCheck::kNewValues);

// Names the value each option takes in --help (BAUD, on|off, N), for a
// command and all below it.
void NameValues(CLI::App* command);

}  // namespace tav::showctl
