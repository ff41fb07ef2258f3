#include "show/ShowFunctions.h"

#include <utility>

#include "show/InteractiveGroupFunctions.h"
#include "show/PlaylistFunctions.h"
#include "show/TriggerFunctions.h"
#include "support/Error.h"
#include "support/Serialize.h"

namespace tav {
namespace {

constexpr int32_t kAnimationPlaylist = 1;
constexpr int32_t kMusicalPlaylist = 2;

// What a file without a Background field plays: all at once, no entries.
constexpr const char* kDefaultBackgroundText = "(2,0,1,0,,)";

constexpr size_t kShowFields = 10;

void ForceType(const std::shared_ptr<Playlist>& playlist, int32_t type) {
  if (!playlist) throw errors::ObjectNotSet("ShowFunctions.NewShow");
  playlist->SetPlaylistType(type);
}

// Below the top level a failing step is skipped and its result stays empty;
// only the player's own errors count as such a failure.
template <typename T, typename Read>
T OrDefault(T fallback, Read&& read) {
  try {
    return std::forward<Read>(read)();
  } catch (const Error&) {
    return fallback;
  }
}

}  // namespace

std::shared_ptr<Show> NewShow(std::shared_ptr<Playlist> startup, std::shared_ptr<Playlist> shutdown,
                              std::shared_ptr<Playlist> main, std::shared_ptr<Playlist> musical,
                              std::shared_ptr<Playlist> background,
                              std::shared_ptr<InteractiveGroupList> groups, int32_t startupType,
                              std::shared_ptr<Trigger> trigger, bool preloadSequences) {
  auto show = std::make_shared<Show>();
  show->SetStartup(std::move(startup));
  show->SetShutdown(std::move(shutdown));
  show->SetMain(std::move(main));
  show->SetMusical(std::move(musical));
  show->SetInteractiveGroups(std::move(groups));
  show->SetBackground(std::move(background));
  show->SetStartupType(startupType);
  show->SetStartupTrigger(std::move(trigger));
  show->SetPreloadSequences(preloadSequences);

  ForceType(show->Startup(), kMusicalPlaylist);
  ForceType(show->Shutdown(), kMusicalPlaylist);
  ForceType(show->Main(), kAnimationPlaylist);
  ForceType(show->Background(), kAnimationPlaylist);
  ForceType(show->Musical(), kMusicalPlaylist);

  // Only real groups belong in the collection; walking backwards keeps the
  // indexes of the entries still to visit valid while removing.
  InteractiveGroupList* list = show->InteractiveGroups().get();
  if (!list) throw errors::ObjectNotSet("ShowFunctions.NewShow");
  for (size_t i = list->size(); i-- > 0;) {
    if (!(*list)[i]) list->erase(list->begin() + static_cast<std::ptrdiff_t>(i));
  }
  return show;
}

std::string ShowToText(const std::shared_ptr<Show>& show) {
  if (!show) throw errors::ObjectNotSet("ShowFunctions.ShowToText");
  return ShowToText(*show);
}

std::string ShowToText(const Show& show) {
  std::vector<std::string> fields;
  fields.reserve(kShowFields);
  fields.push_back(PlaylistToText(show.Startup()));
  fields.push_back(PlaylistToText(show.Shutdown()));
  fields.push_back(PlaylistToText(show.Main()));
  fields.push_back(PlaylistToText(show.Musical()));
  fields.push_back(EscapeText(""));
  fields.push_back(PlaylistToText(show.Background()));

  const InteractiveGroupList* groups = show.InteractiveGroups().get();
  if (!groups) throw errors::ObjectNotSet("ShowFunctions.ShowToText");
  std::string groupsField;
  if (!groups->empty()) {
    std::vector<std::string> groupTexts;
    groupTexts.reserve(groups->size());
    for (const auto& group : *groups) groupTexts.push_back(InteractiveGroupToText(group));
    groupsField = ListToText(groupTexts);
  }
  fields.push_back(std::move(groupsField));

  fields.push_back(LongToText(show.StartupType()));
  fields.push_back(show.StartupTrigger() ? TriggerToText(show.StartupTrigger()) : std::string());
  fields.push_back(BoolToText(show.PreloadSequences()));
  return ListToText(fields);
}

std::shared_ptr<Show> ShowFromText(std::string_view text) {
  TextArray read = ListFromText(text, 1);
  std::vector<std::string> fields = read.Items();

  // Older files are shorter; each step runs only while the list is still
  // short of that field. Files of fewer than five fields get empty playlist
  // texts, which then fail to read below.
  if (fields.size() < 6) {
    fields.resize(6);
    fields[5] = kDefaultBackgroundText;
  }
  if (fields.size() < 7) fields.resize(7);
  if (fields.size() < 8) fields.push_back(LongToText(0));
  if (fields.size() < 9) fields.resize(9);
  if (fields.size() < 10) fields.push_back(BoolToText(false));

  // A badly formatted groups field still fails the whole read.
  TextArray groupTexts = ListFromText(fields[6], 1);
  auto groups = std::make_shared<InteractiveGroupList>();
  for (const auto& groupText : groupTexts.Items()) {
    auto group = OrDefault<std::shared_ptr<InteractiveGroup>>(
        nullptr, [&] { return InteractiveGroupFromText(groupText); });
    if (group) groups->push_back(std::move(group));
  }

  std::shared_ptr<Trigger> trigger;
  if (!fields[8].empty()) {
    trigger =
        OrDefault<std::shared_ptr<Trigger>>(nullptr, [&] { return TriggerFromText(fields[8]); });
  }

  auto readPlaylist = [&](size_t index) {
    return OrDefault<std::shared_ptr<Playlist>>(nullptr,
                                                [&] { return PlaylistFromText(fields[index]); });
  };
  std::shared_ptr<Playlist> startup = readPlaylist(0);
  std::shared_ptr<Playlist> shutdown = readPlaylist(1);
  std::shared_ptr<Playlist> main = readPlaylist(2);
  std::shared_ptr<Playlist> musical = readPlaylist(3);
  std::shared_ptr<Playlist> background = readPlaylist(5);

  int32_t startupType = OrDefault<int32_t>(0, [&] { return LongFromText(fields[7]); });
  bool preload = BoolFromText(fields[9]);

  // A playlist that could not be read is null here, and NewShow fails on it:
  // the caller gets no show rather than a show with a section missing.
  return OrDefault<std::shared_ptr<Show>>(nullptr, [&] {
    return NewShow(startup, shutdown, main, musical, background, groups, startupType, trigger,
                   preload);
  });
}

}  // namespace tav
