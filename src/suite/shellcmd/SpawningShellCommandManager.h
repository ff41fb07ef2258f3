#pragma once
// The shell-command manager of the player: commands start through a
// ProcessSpawner and a timer reaps them every kReapIntervalMs while any
// runs, so finished children never linger and nothing ever waits.
// Owned by the show engine; the spawner and timer service are shared.

#include <memory>
#include <vector>

#include "ports/TimerService.h"
#include "suite/shellcmd/ProcessSpawner.h"
#include "suite/shellcmd/ShellCommandManager.h"

namespace tav {

class SpawningShellCommandManager : public ShellCommandManager {
 public:
  static constexpr uint32_t kReapIntervalMs = 200;

  SpawningShellCommandManager(std::shared_ptr<ProcessSpawner> spawner, TimerService& timers);

  std::shared_ptr<ShellCommand> PrepareCommand(const std::string& commandLine) override;
  void RunCommand(const ShellCommand& command) override;
  size_t RunningCount() const override { return m_running.size(); }
  void SetOnFinished(FinishedHandler handler) override { m_onFinished = std::move(handler); }

  // What the timer does; public so a host shutting down can reap at once.
  void Reap();

 private:
  struct Running {
    int64_t processId;
    ShellCommand command;
  };

  std::shared_ptr<ProcessSpawner> m_spawner;
  std::unique_ptr<Timer> m_reapTimer;
  std::vector<Running> m_running;
  FinishedHandler m_onFinished;
};

}  // namespace tav
