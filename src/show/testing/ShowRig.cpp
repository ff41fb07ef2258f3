#include "show/testing/ShowRig.h"

#include <fstream>
#include <iterator>

#include "platform/LocalFileSystem.h"
#include "show/ShowFunctions.h"
#include "suite/seqlib/FileSequenceLibrary.h"
#include "suite/seqlib/PlainSequence.h"
#include "support/Error.h"
#include "support/testing/TestData.h"

namespace tav {

ShowRig::ShowRig(DateTime start)
    : clock(std::make_shared<ManualClock>(start, 1'000'000)),
      settings(registry, PathDefaults{"/nonexistent/", "/nonexistent/", '/'}),
      memory(std::make_shared<FixedProcessMemory>(50 * 1024 * 1024)),
      cio(std::make_shared<RecordingChannelIO>()),
      media(*clock, timers, &timeline),
      host(timeline),
      m_folder("tav-show") {
  clock->Follow(timers);
  timeline.SetTimeSource([this] { return timers.NowMs(); });
  timeline.SetPathPrefix(m_folder.Path());
  cio->SetOnCall([this](const RecordingChannelIO::Call& call) {
    timeline.Add("cio " + call.text +
                 (call.dueTick ? " @" + std::to_string(call.dueTick - 1'000'000u) : std::string()));
  });
  // Exports would add files and log lines the shows here do not need.
  settings.Set(settings::kUseCompressedSequences, false);
  auto files = LocalFileSystem();
  auto resolver =
      std::make_shared<PathResolver>(files, [dir = m_folder.Path()](int32_t) { return dir; });
  auto library = std::make_shared<FileSequenceLibrary>(clock, files, resolver);
  sequenceServices = {library, resolver, files,
                      &host,   memory,   [this] { return settings.UseCompressedSequences(); }};
  double next = 0.0;
  random = [next]() mutable {
    next += 0.37;
    if (next >= 1.0) next -= 1.0;
    return next;
  };
}

ShowRig::~ShowRig() {
  m_actions.clear();
  player.reset();
}

std::string ShowRig::WriteFile(const std::string& name, const std::string& bytes) {
  return m_folder.Write(name, bytes);
}

std::string ShowRig::WriteSequence(const std::string& name, const SequenceData& data) {
  return WriteFile(name, WritePlainSequence(data));
}

std::string ShowRig::CopyTestData(const std::string& relative, const std::string& name) {
  std::ifstream in(testing::TestDataFile(relative), std::ios::binary);
  if (!in) throw Error(53, "ShowRig.CopyTestData", "missing test data " + relative);
  std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  return WriteFile(name, bytes);
}

std::shared_ptr<Show> ShowRig::MakeShow(const std::string& filename, const ShowParts& parts,
                                        DateTime from, int minutes, int32_t scheduleType) {
  auto list = [this, &parts](const std::vector<std::string>& names) {
    auto playlist = std::make_shared<Playlist>();
    for (const std::string& name : names) playlist->List().Add(PathOf(name));
    playlist->SetLightsOffAtEnd(parts.lightsOffAtEnd);
    return playlist;
  };
  auto groups = std::make_shared<InteractiveGroupList>(parts.groups);
  auto show = NewShow(list(parts.startup), list(parts.shutdown), list(parts.main),
                      list(parts.musical), list(parts.background), groups, parts.startupType,
                      parts.startupTrigger, parts.preload);
  show->Main()->SetAnimationType(parts.animationType);
  show->Background()->SetAnimationType(2);
  show->Musical()->SetMusicalType(parts.musicalType);
  show->Musical()->SetDelay(parts.delay);
  if (!parts.cleanUp.empty()) show->Musical()->SetCleanUp(PathOf(parts.cleanUp));
  show->Musical()->SetShuffleWithReplacement(parts.shuffleWithReplacement);
  show->Musical()->SetShuffleAllowsBackToBack(parts.shuffleAllowsBackToBack);
  auto event = std::make_shared<MonitoredShowEvent>();
  event->SetFilename(filename);
  auto range = std::make_shared<TimeRange>();
  range->SetStartTime(from);
  range->SetEndTime(from.AddSeconds(static_cast<int64_t>(minutes) * 60));
  event->SetRange(range);
  event->SetScheduleType(scheduleType);
  show->SetMonitoring(event);
  return show;
}

std::shared_ptr<InteractiveGroup> ShowRig::Group(bool independent, bool interruptible,
                                                 std::shared_ptr<Trigger> trigger,
                                                 const std::vector<std::string>& sequences) {
  auto group = std::make_shared<InteractiveGroup>();
  group->SetIndependent(independent);
  group->SetInterruptible(interruptible);
  group->SetLightsOffAtEnd(false);
  auto binding = std::make_shared<TriggeredSequences>();
  binding->SetTrig(std::move(trigger));
  for (const std::string& name : sequences) binding->AddSequence(PathOf(name));
  group->AddTriggeredSequences(binding);
  return group;
}

void ShowRig::Start(ShowPlayer::Pacing pacing) {
  ShowPlayerServices services;
  services.clock = clock.get();
  services.settings = &settings;
  services.registry = &registry;
  services.memory = memory;
  services.sequences = sequenceServices;
  services.shellCommands = &shell;
  services.random = random;
  player = std::make_unique<ShowPlayer>(std::move(services));
  player->SetPacing(pacing);
  tmrShowPlayer = timers.CreateTimer("tmrShowPlayer", 1, false, nullptr);
  player->InitControls(host, *tmrShowPlayer, cio, media);
}

void ShowRig::At(uint64_t ms, std::function<void()> action) {
  auto timer = timers.CreateTimer("action", 0, true, nullptr);
  Timer* raw = timer.get();
  raw->SetOnTick([action = std::move(action)] { action(); });
  raw->SetNextTickIn(static_cast<uint32_t>(ms));
  m_actions.push_back(std::move(timer));
}

void ShowRig::Press(int32_t network, int32_t unit, int32_t input, const std::string& name) {
  cio->RaiseInput(network, unit, input, name);
}

}  // namespace tav
