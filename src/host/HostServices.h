#pragma once
// Everything the host form is built from: the ports of the core, the suite's
// components and two hooks into the program around it. The composition root
// (apps/showplayer) hands in the real adapters; host tests hand in doubles on
// virtual time. Every reference must outlive the form.

#include <functional>
#include <memory>
#include <string>

#include "config/NetworkPreferences.h"
#include "config/RegistryStore.h"
#include "config/Settings.h"
#include "host/TrayLink.h"
#include "ports/Clock.h"
#include "ports/ProcessMemory.h"
#include "ports/TimerService.h"
#include "schedule/TextFileStore.h"
#include "show/MediaPlayer.h"
#include "suite/channelio/ChannelIO.h"
#include "suite/seqlib/FileSystem.h"
#include "suite/seqlib/PathResolver.h"
#include "suite/seqlib/SequenceLibrary.h"
#include "suite/shellcmd/ShellCommandManager.h"

namespace tav {

struct HostServices {
  TimerService& timers;
  const Clock& clock;
  // The settings store; the folders the settings fall back to.
  RegistryStore& registry;
  PathDefaults pathDefaults;
  TrayLink& trayLink;
  // The schedule files and the show files.
  TextFileStore& files;
  std::shared_ptr<ChannelIO> cio;
  // The media player of the video form.
  MediaPlayer& media;
  std::shared_ptr<const ProcessMemory> memory;
  std::shared_ptr<SequenceLibrary> library;
  std::shared_ptr<FileSystem> fileSystem;
  // Sequence and media names to paths (folders under UserDataPath).
  std::shared_ptr<const PathResolver> resolver;
  std::shared_ptr<ShellCommandManager> shellCommands;

  // What the platform shows in a message box (the program has no window: the
  // entry point writes it to standard error). The form logs it as well.
  std::function<void(const std::string& text)> messageBox = {};
  // Called once, when the form has unloaded: the program ends.
  std::function<void()> onUnloaded = {};
  // Called with the engine's network preferences once it has applied them
  // (at load, and after each change announced in the registry), so that
  // the composition root can place FSEQ channels on the new universes.
  std::function<void(const NetworkPreferences&)> networkPreferencesApplied = {};
};

}  // namespace tav
