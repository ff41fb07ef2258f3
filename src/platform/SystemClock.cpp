#include "platform/SystemClock.h"

#include <chrono>
#include <ctime>

namespace tav {

DateTime SystemClock::Now() const {
  std::time_t now = std::time(nullptr);
  std::tm local{};
  localtime_r(&now, &local);
  // localtime_r yields a leap second as :60; the serial date has no room for
  // it, so it reads as :59.
  int second = local.tm_sec > 59 ? 59 : local.tm_sec;
  return DateTime::FromParts(local.tm_year + 1900, local.tm_mon + 1, local.tm_mday, local.tm_hour,
                             local.tm_min, second);
}

double SystemClock::SecondsSinceMidnight() const {
  auto now = std::chrono::system_clock::now();
  std::time_t seconds = std::chrono::system_clock::to_time_t(now);
  auto fraction = std::chrono::duration_cast<std::chrono::milliseconds>(
                      now - std::chrono::system_clock::from_time_t(seconds))
                      .count();
  if (fraction < 0) fraction = 0;
  std::tm local{};
  localtime_r(&seconds, &local);
  int second = local.tm_sec > 59 ? 59 : local.tm_sec;
  return local.tm_hour * 3600 + local.tm_min * 60 + second + static_cast<double>(fraction) / 1000.0;
}

uint32_t SystemClock::TickCount() const {
  auto since = std::chrono::steady_clock::now().time_since_epoch();
  auto ms = std::chrono::duration_cast<std::chrono::milliseconds>(since).count();
  return static_cast<uint32_t>(static_cast<uint64_t>(ms));
}

}  // namespace tav
