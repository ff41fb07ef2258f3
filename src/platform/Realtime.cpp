#include "platform/Realtime.h"

#include <sched.h>

#include <cerrno>
#include <cstring>

namespace tav {

std::string RequestRealtimePriority(int priority) {
  sched_param param{};
  param.sched_priority = priority;
  // Children (shell commands of sequences, say) start at normal priority:
  // a busy one must never starve the machine.
  if (::sched_setscheduler(0, SCHED_FIFO | SCHED_RESET_ON_FORK, &param) != 0) {
    return std::strerror(errno);
  }
  return "";
}

}  // namespace tav
