#pragma once
// The two ways DMX universes travel over UDP.

namespace tav {

enum class DMXProtocol { kE131, kArtNet };

}  // namespace tav
