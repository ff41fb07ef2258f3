#include "suite/channelio/serial/X10Codes.h"

#include <array>

namespace tav {
namespace {

// Codes of houses A-P and units 1-16, in that order.
constexpr std::array<uint8_t, 16> kCodes = {0x6, 0xE, 0x2, 0xA, 0x1, 0x9, 0x5, 0xD,
                                            0x7, 0xF, 0x3, 0xB, 0x0, 0x8, 0x4, 0xC};

}  // namespace

std::string X10FunctionName(X10Function function) {
  static const std::array<const char*, 16> kNames = {"All Units Off",
                                                     "All Lights On",
                                                     "On",
                                                     "Off",
                                                     "Dim",
                                                     "Bright",
                                                     "All Lights Off",
                                                     "Extended Code",
                                                     "Hail Request",
                                                     "Hail Acknowledge",
                                                     "Preset Dim 1",
                                                     "Preset Dim 2",
                                                     "Extended Data",
                                                     "Status On",
                                                     "Status Off",
                                                     "Status Request"};
  return kNames[static_cast<uint8_t>(function) & 0xF];
}

uint8_t X10Code(int32_t houseOrUnit) {
  return kCodes[static_cast<size_t>((houseOrUnit - 1) & 0xF)];
}

int32_t X10FromCode(uint8_t code) {
  for (size_t i = 0; i < kCodes.size(); ++i) {
    if (kCodes[i] == (code & 0xF)) return static_cast<int32_t>(i) + 1;
  }
  return 0;  // unreachable: the table holds every nibble
}

char X10HouseLetter(int32_t house) {
  return house >= 1 && house <= 16 ? static_cast<char>('A' + house - 1) : '?';
}

int32_t X10HouseFromLetter(char letter) {
  if (letter >= 'a' && letter <= 'p') return letter - 'a' + 1;
  if (letter >= 'A' && letter <= 'P') return letter - 'A' + 1;
  return 0;
}

X10Transmission X10Transmission::Address(int32_t house, int32_t unit) {
  X10Transmission t;
  t.house = house;
  t.unit = unit;
  return t;
}

X10Transmission X10Transmission::Function(int32_t house, X10Function function, int32_t dimSteps) {
  X10Transmission t;
  t.isFunction = true;
  t.house = house;
  t.function = function;
  t.dimSteps = dimSteps;
  return t;
}

std::array<uint8_t, 2> X10Transmission::Bytes() const {
  const uint8_t houseCode = static_cast<uint8_t>(X10Code(house) << 4);
  if (!isFunction) return {0x04, static_cast<uint8_t>(houseCode | X10Code(unit))};
  int32_t steps = 0;
  if (function == X10Function::kDim || function == X10Function::kBright) {
    steps = dimSteps < 0 ? 0 : (dimSteps > kX10DimStepsFull ? kX10DimStepsFull : dimSteps);
  }
  return {static_cast<uint8_t>(0x06 | (steps << 3)),
          static_cast<uint8_t>(houseCode | static_cast<uint8_t>(function))};
}

std::string X10Transmission::ToString() const {
  std::string text(1, X10HouseLetter(house));
  if (!isFunction) return text + std::to_string(unit);
  text += " " + X10FunctionName(function);
  if (function == X10Function::kDim || function == X10Function::kBright)
    text += " " + std::to_string(dimSteps);
  return text;
}

uint8_t X10Checksum(std::span<const uint8_t> bytes) {
  uint8_t sum = 0;
  for (uint8_t b : bytes) sum = static_cast<uint8_t>(sum + b);
  return sum;
}

std::array<uint8_t, 7> Cm11aSetClockMessage(const DateTime& now, int32_t monitoredHouse) {
  const int hour = now.Hour();
  const int64_t yearDay =
      now.DateOnly().SecondsSince(DateTime::FromParts(now.Year(), 1, 1)) / 86400;
  return {kCm11aSetClock,
          static_cast<uint8_t>(now.Second()),
          static_cast<uint8_t>(now.Minute() + 60 * (hour % 2)),
          static_cast<uint8_t>(hour / 2),
          static_cast<uint8_t>(yearDay & 0xFF),
          static_cast<uint8_t>((1 << now.DayOfWeek()) | ((yearDay >> 8) & 1) << 7),
          static_cast<uint8_t>(X10Code(monitoredHouse) << 4)};
}

}  // namespace tav
