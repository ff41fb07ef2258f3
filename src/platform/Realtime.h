#pragma once
// Real-time scheduling for the thread that keeps the frame deadlines. At
// normal priority a busy machine can delay a wake-up by milliseconds; at
// SCHED_FIFO the frame interval holds to a few tens of microseconds (see
// docs/performance.md). Needs CAP_SYS_NICE (root, or a systemd unit with
// CPUSchedulingPolicy=fifo or AmbientCapabilities=CAP_SYS_NICE).

#include <string>

namespace tav {

// Puts the calling thread at SCHED_FIFO `priority` (1-99); processes and
// threads it makes afterwards start at normal priority. "" on success,
// otherwise the reason it was refused.
std::string RequestRealtimePriority(int priority);

}  // namespace tav
