#pragma once
// X10 as a CM11A-style computer interface speaks it: the 4-bit codes of
// houses A-P and units 1-16, the function codes, the two bytes of one
// power-line transmission (an address or a function) and its checksum, the
// interface's control bytes, and the set-clock message.
//
// A power-line command is two transmissions: an address ("A1") and then a
// function for the house ("A On"). Dim and Bright carry a step count in the
// header byte; 22 steps span the whole range.
//
// Pure: no I/O.

#include <array>
#include <cstdint>
#include <span>
#include <string>

#include "support/DateTime.h"

namespace tav {

enum class X10Function : uint8_t {
  kAllUnitsOff = 0x0,
  kAllLightsOn = 0x1,
  kOn = 0x2,
  kOff = 0x3,
  kDim = 0x4,
  kBright = 0x5,
  kAllLightsOff = 0x6,
  kExtendedCode = 0x7,
  kHailRequest = 0x8,
  kHailAcknowledge = 0x9,
  kPresetDim1 = 0xA,
  kPresetDim2 = 0xB,
  kExtendedData = 0xC,
  kStatusOn = 0xD,
  kStatusOff = 0xE,
  kStatusRequest = 0xF,
};
// "On", "Dim", "All Units Off", ...
std::string X10FunctionName(X10Function function);

inline constexpr int32_t kX10DimStepsFull = 22;

// Bytes the interface sends or expects outside a transmission.
inline constexpr uint8_t kCm11aTransmitOk = 0x00;        // host: "checksum right, transmit"
inline constexpr uint8_t kCm11aReady = 0x55;             // interface: transmission finished
inline constexpr uint8_t kCm11aPoll = 0x5A;              // interface: has received data to upload
inline constexpr uint8_t kCm11aPollReply = 0xC3;         // host: "send the upload"
inline constexpr uint8_t kCm11aClockRequest = 0xA5;      // interface lost power (CP11)
inline constexpr uint8_t kCm11aClockRequestCP10 = 0xA6;  // the same from a CP10
inline constexpr uint8_t kCm11aSetClock = 0x9B;          // host: set-clock message follows
inline constexpr uint8_t kCm11aMacro = 0x5B;         // interface: macro ran; 2 address bytes follow
inline constexpr uint8_t kCm11aFilterFailed = 0xF3;  // interface: input filter failed
inline constexpr int32_t kCm11aMaxUpload = 9;        // bytes after the upload's size byte
inline constexpr int32_t kCm11aBaud = 4800;

// House (1-16 for A-P) or unit (1-16) to its 4-bit code; 0-15 code back to
// 1-16. Houses and units share the table.
uint8_t X10Code(int32_t houseOrUnit);
int32_t X10FromCode(uint8_t code);
// 'A'-'P' for 1-16, '?' otherwise; a letter (either case) to 1-16, or 0.
char X10HouseLetter(int32_t house);
int32_t X10HouseFromLetter(char letter);

// One power-line transmission.
struct X10Transmission {
  bool isFunction = false;
  int32_t house = 1;  // 1-16
  int32_t unit = 1;   // 1-16, addresses only
  X10Function function = X10Function::kOn;
  int32_t dimSteps = 0;  // 0-22, Dim and Bright only

  static X10Transmission Address(int32_t house, int32_t unit);
  static X10Transmission Function(int32_t house, X10Function function, int32_t dimSteps = 0);

  // Header byte (dim steps in bits 7-3, bit 2 set, bit 1 function) and code
  // byte (house code high, unit or function code low).
  std::array<uint8_t, 2> Bytes() const;
  // "A1", "A On", "A Dim 11".
  std::string ToString() const;

  friend bool operator==(const X10Transmission&, const X10Transmission&) = default;
};

// The interface's checksum: the sum of the bytes, modulo 256.
uint8_t X10Checksum(std::span<const uint8_t> bytes);

// The set-clock message: 0x9B, seconds, minutes 0-119, hours / 2, day of the
// year (low 8 bits), weekday mask (bit 0 Sunday) with the day's ninth bit in
// bit 7, and the monitored house's code in the high nibble. The interface
// answers with the checksum of the six bytes after 0x9B.
std::array<uint8_t, 7> Cm11aSetClockMessage(const DateTime& now, int32_t monitoredHouse);

}  // namespace tav
