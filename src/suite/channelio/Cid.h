#pragma once
// The component identifier (CID) an E1.31 source puts in every packet: a
// UUID that stays the same for the life of the installation, so receivers
// tell our packets from other sources' across restarts. It is made once and
// kept in the network preferences as text ("0f1e2d3c-...", braces allowed
// when read).

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

namespace tav {

using Cid = std::array<uint8_t, 16>;

// Reads 32 hexadecimal digits, with or without the hyphens of the usual
// 8-4-4-4-12 form and surrounding braces. False (and `cid` untouched) for
// anything else, including the all-zero UUID, which no source may use.
bool ParseCid(std::string_view text, Cid& cid);
// Lower-case 8-4-4-4-12 form without braces.
std::string FormatCid(const Cid& cid);
// A random (version 4) UUID from the standard library's random device.
Cid NewRandomCid();

}  // namespace tav
