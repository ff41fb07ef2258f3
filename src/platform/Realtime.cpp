#include "platform/Realtime.h"

#include <sched.h>

#include <cerrno>
#include <cstring>

namespace tav {

std::string RequestRealtimePriority(int priority) {
  sched_param param{};
  param.sched_priority = priority;
  if (::sched_setscheduler(0, SCHED_FIFO, &param) != 0) return std::strerror(errno);
  return "";
}

}  // namespace tav
