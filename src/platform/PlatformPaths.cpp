#include "platform/PlatformPaths.h"

#include <pwd.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <vector>

namespace tav {

namespace {

std::string Environment(const char* name) {
  const char* value = std::getenv(name);
  return value ? value : "";
}

std::string HomeFolder() {
  std::string home = Environment("HOME");
  if (!home.empty()) return home;
  std::vector<char> buffer(16384);
  passwd entry{};
  passwd* found = nullptr;
  if (getpwuid_r(getuid(), &entry, buffer.data(), buffer.size(), &found) == 0 && found) {
    return found->pw_dir;
  }
  return "/";
}

// $variable if it is an absolute path, else the home folder + fallback.
std::string XdgFolder(const char* variable, const char* fallback) {
  std::string value = Environment(variable);
  if (!value.empty() && value.front() == '/') return value;
  std::string home = HomeFolder();
  if (home.back() != '/') home += '/';
  return home + fallback;
}

}  // namespace

std::string RegistryFilePath() {
  std::string explicitPath = Environment("TAV_REGISTRY_FILE");
  if (!explicitPath.empty()) return explicitPath;
  return XdgFolder("XDG_CONFIG_HOME", ".config") + "/tessavar/registry.reg";
}

PathDefaults SystemPathDefaults() {
  PathDefaults defaults;
  defaults.userDataFolder = XdgFolder("XDG_DATA_HOME", ".local/share") + "/tessavar/";
  std::error_code error;
  std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", error);
  defaults.appFolder = error ? "" : program.parent_path().string() + "/";
  defaults.separator = '/';
  return defaults;
}

}  // namespace tav
