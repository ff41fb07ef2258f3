#include "show/Show.h"

#include "show/PlaylistFunctions.h"
#include "show/ShowFunctions.h"
#include "support/Error.h"

namespace tav {

Show::Show()
    : m_startup(NewMusicalPlaylist(1, 0)),
      m_shutdown(NewMusicalPlaylist(1, 0)),
      m_main(NewAnimationPlaylist(1)),
      m_musical(NewMusicalPlaylist(1, 0)),
      m_background(NewAnimationPlaylist(2)),
      m_interactiveGroups(std::make_shared<InteractiveGroupList>()),
      m_monitoring(std::make_shared<MonitoredShowEvent>()) {}

bool Show::HasSameContents(const std::shared_ptr<Show>& other) const {
  return other && HasSameContents(*other);
}

bool Show::HasSameContents(const Show& other) const {
  try {
    return ShowToText(*this) == ShowToText(other);
  } catch (const Error&) {
    return false;
  }
}

void Show::SetMonitoring(std::shared_ptr<MonitoredShowEvent> value) {
  m_monitoring = value ? std::move(value) : std::make_shared<MonitoredShowEvent>();
}

}  // namespace tav
