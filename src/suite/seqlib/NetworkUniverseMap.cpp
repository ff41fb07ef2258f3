#include "suite/seqlib/NetworkUniverseMap.h"

#include <vector>

namespace tav {

UniverseMap UniverseMapOf(const NetworkPreferences& prefs) {
  std::vector<UniverseSpan> spans;
  for (int32_t i = 0; i < prefs.DMXUniverseCount(); ++i) {
    const DMXUniversePrefs& u = prefs.DMXUniverse(i);
    if (!u.Enabled() || u.StartChannel() < 1 || u.Size() < 1 || u.Size() > 512) continue;
    spans.push_back({u.Universe(), static_cast<uint32_t>(u.StartChannel() - 1),
                     static_cast<uint32_t>(u.Size())});
  }
  return spans.empty() ? UniverseMap::Uniform() : UniverseMap::FromSpans(std::move(spans));
}

}  // namespace tav
