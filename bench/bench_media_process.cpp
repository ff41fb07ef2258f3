// What the media process costs and how well the player follows it. A tiny
// player (this program: the event loop and MediaProcessPlayer, no libmpv)
// starts the real media process with the null outputs and plays a WAV file
// it writes. Prints:
//   - resident memory (VmRSS, RssAnon) and threads of this program and of
//     the media process, idle (after a first play) and while playing;
//   - CPU time of both over a quiet play (the loop idles as the player's
//     would between frames);
//   - over a second play, the position the player gives (sampled every
//     millisecond) against mpv's own time-pos: each sample is compared with
//     the latest report of mpv at or before the sample's moment (including
//     reports still on their way to the player), run on to that moment at
//     the steady clock's pace. Also the interval between mpv's reports and
//     the time each took to reach the player.
//
//   bench_media_process [--cpu-seconds 20] [--sync-seconds 60]
//
// The media process is found as the player finds it ($TAV_MEDIA_HELPER, or
// beside this program), else at the path it was built to.

#include <cstddef>
// clang-format off
#include <asio.hpp>
// clang-format on
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "platform/EventLoop.h"
#include "platform/media/MediaProcessPlayer.h"
#include "platform/media/testing/ToneWav.h"
#include "ports/testing/RecordingMessageLog.h"
#include "support/testing/TempFolder.h"

namespace {

using SteadyClock = std::chrono::steady_clock;
using namespace std::chrono_literals;

struct ProcessFigures {
  long rssKb = 0;
  long anonKb = 0;
  long threads = 0;
};

ProcessFigures Figures(long pid) {
  std::ifstream in("/proc/" + std::to_string(pid) + "/status");
  ProcessFigures figures;
  std::string key;
  while (in >> key) {
    if (key == "VmRSS:") in >> figures.rssKb;
    if (key == "RssAnon:") in >> figures.anonKb;
    if (key == "Threads:") in >> figures.threads;
    std::getline(in, key);
  }
  return figures;
}

// User plus system CPU seconds of a process.
double CpuSeconds(long pid) {
  std::ifstream in("/proc/" + std::to_string(pid) + "/stat");
  std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  std::istringstream fields(text.substr(text.rfind(')') + 2));
  std::string field;
  double ticks = 0;
  for (int i = 3; i <= 15 && fields >> field; ++i) {
    if (i == 14 || i == 15) ticks += std::stod(field);
  }
  return ticks / static_cast<double>(::sysconf(_SC_CLK_TCK));
}

double Percentile(std::vector<double> values, double p) {
  if (values.empty()) return NAN;
  std::sort(values.begin(), values.end());
  size_t index = static_cast<size_t>(std::ceil(p / 100.0 * values.size()));
  return values[std::clamp<size_t>(index, 1, values.size()) - 1];
}

std::string Program() {
  const char* named = std::getenv(tav::MediaProcessPlayer::kProgramVariable);
  if (named && *named) return named;
  std::string beside = tav::MediaProcessPlayer::DefaultProgramPath();
  if (::access(beside.c_str(), X_OK) == 0) return beside;
  return TAV_MEDIA_PROGRAM;
}

void PrintFigures(const char* what, long pid) {
  ProcessFigures f = Figures(pid);
  std::printf("  %-28s VmRSS %6.1f MB   RssAnon %6.1f MB   threads %ld\n", what, f.rssKb / 1024.0,
              f.anonKb / 1024.0, f.threads);
}

class Bench {
 public:
  Bench() : player(loop, log, {"null", "", "null"}, Program()), sampler(loop.Context()) {}

  bool RunUntil(const std::function<bool()>& done, std::chrono::seconds limit) {
    auto deadline = SteadyClock::now() + limit;
    while (!done()) {
      if (SteadyClock::now() > deadline) return false;
      loop.RunFor(5ms);
    }
    return true;
  }

  bool Play(const std::string& path) {
    player.OpenMedia(path);
    return RunUntil([&] { return player.PlayState() == tav::kMediaPlaying; }, 10s);
  }

  void SampleEveryMillisecond(SteadyClock::time_point until) {
    sampler.expires_at(SteadyClock::now() + 1ms);
    sampler.async_wait([this, until](const asio::error_code& error) {
      if (error) return;
      auto now = SteadyClock::now();
      samples.push_back({now, player.CurrentPosition()});
      auto report = player.LatestReport();
      if (report.clock.running && (reports.empty() || report.received != reports.back().received)) {
        reports.push_back(report);
      }
      if (now < until) SampleEveryMillisecond(until);
    });
  }

  struct Sample {
    SteadyClock::time_point at;
    double position;
  };

  tav::EventLoop loop;
  tav::RecordingMessageLog log;
  tav::MediaProcessPlayer player;
  asio::steady_timer sampler;
  std::vector<Sample> samples;
  std::vector<tav::MediaProcessPlayer::PositionReport> reports;
};

}  // namespace

int main(int argc, char** argv) {
  int cpuSeconds = 20;
  int syncSeconds = 60;
  for (int i = 1; i + 1 < argc; i += 2) {
    std::string option = argv[i];
    if (option == "--cpu-seconds") cpuSeconds = std::atoi(argv[i + 1]);
    if (option == "--sync-seconds") syncSeconds = std::atoi(argv[i + 1]);
  }
  tav::TempFolder folder("tav-bench-media");
  // CD quality: what music files decode to.
  std::string wav =
      folder.Write("tone.wav", tav::ToneWav(std::max(cpuSeconds, syncSeconds) + 5, 44100, 2));

  Bench bench;
  long self = ::getpid();
  // The media process starts with the first play: a play stopped at once
  // leaves it idle (until the idle limit, a minute) with libmpv loaded.
  if (!bench.Play(wav)) {
    std::fprintf(stderr, "the media process did not start playing\n");
    return 1;
  }
  long media = bench.player.ProcessId();
  bench.player.Stop();
  bench.loop.RunFor(1500ms);
  std::printf("memory and threads\n");
  PrintFigures("player side, idle", self);
  PrintFigures("media process, idle", media);

  if (!bench.Play(wav)) {
    std::fprintf(stderr, "the media process did not start playing\n");
    return 1;
  }
  bench.loop.RunFor(1000ms);
  PrintFigures("player side, playing", self);
  PrintFigures("media process, playing", media);

  double selfBefore = CpuSeconds(self), mediaBefore = CpuSeconds(media);
  auto quietStart = SteadyClock::now();
  bench.loop.RunFor(std::chrono::seconds(cpuSeconds));
  double elapsed = std::chrono::duration<double>(SteadyClock::now() - quietStart).count();
  std::printf("CPU while playing (%.0f s, %% of one core)\n", elapsed);
  std::printf("  player side     %6.2f %%\n", 100 * (CpuSeconds(self) - selfBefore) / elapsed);
  std::printf("  media process   %6.2f %%\n", 100 * (CpuSeconds(media) - mediaBefore) / elapsed);

  // A fresh play, followed from its start.
  bench.player.Stop();
  if (!bench.Play(wav)) return 1;
  bench.SampleEveryMillisecond(SteadyClock::now() + std::chrono::seconds(syncSeconds));
  bench.loop.RunFor(std::chrono::seconds(syncSeconds) + 200ms);

  // mpv's time-pos as a line through its latest report.
  auto lineAt = [](const tav::MediaClock::Snapshot& report, SteadyClock::time_point t) {
    return report.position + std::chrono::duration<double>(t - report.at).count();
  };
  auto ms = [](SteadyClock::duration d) {
    return std::chrono::duration<double, std::milli>(d).count();
  };
  std::vector<double> errors, jumps, gaps, delays;
  const auto& reports = bench.reports;
  for (size_t i = 0; i < reports.size(); ++i) {
    delays.push_back(ms(reports[i].received - reports[i].clock.at));
    if (i == 0) continue;
    gaps.push_back(ms(reports[i].clock.at - reports[i - 1].clock.at));
    // How far the line moved: the error of the player between the report
    // and its arrival.
    const auto& now = reports[i].clock;
    jumps.push_back(std::abs(now.position - lineAt(reports[i - 1].clock, now.at)) * 1000);
  }
  size_t next = 0;
  for (const auto& sample : bench.samples) {
    while (next < reports.size() && reports[next].clock.at <= sample.at) ++next;
    if (next == 0) continue;  // before the first report
    errors.push_back(std::abs(sample.position - lineAt(reports[next - 1].clock, sample.at)) * 1000);
  }
  auto print = [](const char* what, const std::vector<double>& values, const char* format) {
    std::printf("  %-34s", what);
    for (double p : {50.0, 99.0, 100.0}) {
      std::printf(p == 100.0 ? "   max " : "   p%.0f ", p);
      std::printf(format, Percentile(values, p));
    }
    std::printf("\n");
  };
  std::printf("position: the player's against mpv's time-pos (%zu samples, %zu reports)\n",
              errors.size(), reports.size());
  print("|error| sampled every ms (ms)", errors, "%7.3f");
  print("|correction| at each report (ms)", jumps, "%7.3f");
  print("report interval (ms)", gaps, "%7.1f");
  print("report delivery (ms)", delays, "%7.3f");
  for (const auto& line : bench.log.lines) std::printf("log: %s\n", line.c_str());
  return 0;
}
