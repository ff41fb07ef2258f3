#include "suite/channelio/serial/X10Codes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "suite/channelio/serial/X10UploadDecoder.h"

namespace tav {
namespace {

using ::testing::ElementsAre;

TEST(X10Codes, WorkedExamplesGiveTheInterfacesBytesAndChecksums) {
  struct Case {
    X10Transmission transmission;
    uint8_t header, code, checksum;
    const char* text;
  };
  const Case cases[] = {
      {X10Transmission::Address(1, 1), 0x04, 0x66, 0x6A, "A1"},
      {X10Transmission::Function(1, X10Function::kOn), 0x06, 0x62, 0x68, "A On"},
      {X10Transmission::Function(1, X10Function::kOff), 0x06, 0x63, 0x69, "A Off"},
      {X10Transmission::Function(1, X10Function::kDim, 11), 0x5E, 0x64, 0xC2, "A Dim 11"},
      {X10Transmission::Function(1, X10Function::kBright, 22), 0xB6, 0x65, 0x1B, "A Bright 22"},
      {X10Transmission::Address(16, 13), 0x04, 0xC0, 0xC4, "P13"},
      // Steps only count for Dim and Bright, and never beyond 22.
      {X10Transmission::Function(2, X10Function::kOn, 5), 0x06, 0xE2, 0xE8, "B On"},
      {X10Transmission::Function(3, X10Function::kDim, 30), 0xB6, 0x24, 0xDA, "C Dim 30"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.text);
    const auto bytes = c.transmission.Bytes();
    EXPECT_THAT(bytes, ElementsAre(c.header, c.code));
    EXPECT_EQ(X10Checksum(bytes), c.checksum);
    EXPECT_EQ(c.transmission.ToString(), c.text);
  }
}

TEST(X10Codes, HouseAndUnitCodesFollowTheTableBothWays) {
  const uint8_t table[16] = {0x6, 0xE, 0x2, 0xA, 0x1, 0x9, 0x5, 0xD,
                             0x7, 0xF, 0x3, 0xB, 0x0, 0x8, 0x4, 0xC};
  for (int32_t n = 1; n <= 16; ++n) {
    EXPECT_EQ(X10Code(n), table[n - 1]) << n;
    EXPECT_EQ(X10FromCode(table[n - 1]), n);
    EXPECT_EQ(X10HouseFromLetter(X10HouseLetter(n)), n);
    EXPECT_EQ(X10HouseFromLetter(static_cast<char>('a' + n - 1)), n);
  }
  EXPECT_EQ(X10HouseFromLetter('Q'), 0);
  EXPECT_EQ(X10HouseLetter(17), '?');
}

TEST(X10Codes, SetClockMessageCarriesTheTimeInTheInterfacesFields) {
  // Tuesday 24 December 2024 (a leap year: day 358 of the year, counting
  // from 0), 17:45:30, monitoring house C.
  const auto message = Cm11aSetClockMessage(DateTime::FromParts(2024, 12, 24, 17, 45, 30), 3);
  EXPECT_THAT(message, ElementsAre(0x9B, 30, 105, 8, 358 - 256, 0x04 | 0x80, 0x20));
  // 1 January, midnight, a Monday.
  EXPECT_THAT(Cm11aSetClockMessage(DateTime::FromParts(2024, 1, 1), 1),
              ElementsAre(0x9B, 0, 0, 0, 0, 0x02, 0x60));
}

TEST(X10Codes, ChecksumOfASetClockMessageIsTheSumAfterItsHeader) {
  // A set-clock message and the checksum an interface answered to it.
  const uint8_t message[] = {0x9B, 0x13, 0x40, 0x0A, 0x48, 0x82, 0x60};
  EXPECT_EQ(X10Checksum(std::span<const uint8_t>(message).subspan(1)), 0x87);
}

X10Received Heard(int32_t house, int32_t unit, X10Function function, int32_t dim = 0) {
  return {house, unit, function, dim};
}

TEST(X10UploadDecoder, FunctionsApplyToEveryUnitAddressedBeforeThem) {
  X10UploadDecoder decoder;
  // A1 A2 A-On: the mask marks the third byte as a function.
  EXPECT_THAT(decoder.Decode(std::vector<uint8_t>{0x04, 0x66, 0x6E, 0x62}),
              ElementsAre(Heard(1, 1, X10Function::kOn), Heard(1, 2, X10Function::kOn)));
  // A new address after a function starts a new list.
  EXPECT_THAT(decoder.Decode(std::vector<uint8_t>{0x02, 0x6E, 0x63}),
              ElementsAre(Heard(1, 2, X10Function::kOff)));
}

TEST(X10UploadDecoder, AddressesCarryOverToTheNextUpload) {
  X10UploadDecoder decoder;
  EXPECT_TRUE(decoder.Decode(std::vector<uint8_t>{0x00, 0x66}).empty());
  EXPECT_THAT(decoder.Decode(std::vector<uint8_t>{0x01, 0x62}),
              ElementsAre(Heard(1, 1, X10Function::kOn)));
}

TEST(X10UploadDecoder, DimAmountFollowsItsFunctionAndHousesStayApart) {
  X10UploadDecoder decoder;
  // A1, B2, A Dim (amount 105), B Off.
  EXPECT_THAT(decoder.Decode(std::vector<uint8_t>{0x14, 0x66, 0xEE, 0x64, 105, 0xE3}),
              ElementsAre(Heard(1, 1, X10Function::kDim, 105), Heard(2, 2, X10Function::kOff)));
  // A function with no unit addressed (All Units Off for house C).
  EXPECT_THAT(decoder.Decode(std::vector<uint8_t>{0x01, 0x20}),
              ElementsAre(Heard(3, 0, X10Function::kAllUnitsOff)));
  EXPECT_TRUE(decoder.Decode({}).empty());
}

}  // namespace
}  // namespace tav
