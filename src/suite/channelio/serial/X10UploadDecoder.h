#pragma once
// Turns what a CM11A-style interface uploads after a poll into the
// commands it heard on the power line: which units of which house got which
// function.
//
// An upload is a mask byte (bit i set: data byte i is a function, bit 0 the
// first) and up to eight data bytes in the code-byte format. X10 addresses
// first and acts second: "A1 A2 A On" switches both units, and the next
// address after a function starts a new list for its house. Addresses and
// functions may arrive in different uploads, so the decoder keeps the
// addressed units of each house between calls. A Dim or Bright function is
// followed by a byte with the amount (0-210, 210 = full range).
//
// Pure: no I/O. One decoder per interface.

#include <array>
#include <cstdint>
#include <span>
#include <vector>

#include "suite/channelio/serial/X10Codes.h"

namespace tav {

struct X10Received {
  int32_t house = 1;  // 1-16
  int32_t unit = 0;   // 1-16; 0 when the function came with no unit addressed
  X10Function function = X10Function::kOn;
  int32_t dimAmount = 0;  // 0-210, Dim and Bright only

  friend bool operator==(const X10Received&, const X10Received&) = default;
};

class X10UploadDecoder {
 public:
  // `upload` is the mask byte and the data bytes (what follows the size
  // byte). Returns one entry per addressed unit for each function.
  std::vector<X10Received> Decode(std::span<const uint8_t> upload);

 private:
  struct House {
    std::vector<int32_t> units;
    bool functionSeen = false;  // the next address starts a new list
  };
  std::array<House, 16> m_houses{};
};

}  // namespace tav
