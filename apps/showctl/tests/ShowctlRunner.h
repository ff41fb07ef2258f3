#pragma once
// Runs the built showctl in a fresh temporary folder, with a clean settings
// location, and captures what it printed and how it exited.

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace tav::showctl::testing {

struct Result {
  int exitCode = -1;
  std::string out;
  std::string err;
};

class ShowctlTest : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/tav-showctl-XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    m_dir = pattern;
  }
  void TearDown() override { std::filesystem::remove_all(m_dir); }

  std::string Path(const std::string& name) const { return m_dir + "/" + name; }

  void Write(const std::string& name, const std::string& bytes) const {
    std::ofstream(Path(name), std::ios::binary) << bytes;
  }
  std::string Read(const std::string& name) const {
    std::ifstream in(Path(name), std::ios::binary);
    std::stringstream s;
    s << in.rdbuf();
    return s.str();
  }

  // Arguments are quoted for the shell; the settings file and user data
  // folder point into the temporary folder.
  Result Run(const std::vector<std::string>& args, const std::string& input = "") const {
    Write(".stdin", input);
    int status = std::system((Command(args) + " <.stdin >.stdout 2>.stderr").c_str());
    Result r;
    r.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    r.out = Read(".stdout");
    r.err = Read(".stderr");
    return r;
  }

  // Starts every command at once and waits for all; true when all of them
  // exited with 0.
  bool RunAtOnce(const std::vector<std::vector<std::string>>& commands) const {
    std::string script;
    for (size_t i = 0; i < commands.size(); ++i) {
      script += "(" + Command(commands[i]) + " >/dev/null 2>.stderr" + std::to_string(i) +
                " || echo failed >.failed) & ";
    }
    std::system((script + "wait").c_str());
    return !std::filesystem::exists(Path(".failed"));
  }

 private:
  std::string Command(const std::vector<std::string>& args) const {
    std::string command = "cd '" + m_dir + "' && TAV_REGISTRY_FILE='" + Path("registry.reg") +
                          "' XDG_DATA_HOME='" + m_dir + "' XDG_RUNTIME_DIR='" + m_dir +
                          "' TAV_TRAY_SOCKET='" + Path("no.sock") + "' " + TAV_SHOWCTL_PATH;
    for (const auto& arg : args) {
      std::string quoted;
      for (char c : arg) quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
      command += " '" + quoted + "'";
    }
    return command;
  }

 protected:
  std::string m_dir;
};

}  // namespace tav::showctl::testing
