#pragma once
// The tray message wire format, in both directions, as pure functions.
//
// A message is a copy-data frame: the sender's window handle, dwData = 3 and
// cbData bytes holding the text and one zero byte. The text is two decimal
// digits giving the type ("07", "13"; "00" for a type outside 1..99) followed
// at once by the body. Received frames are decoded the way the tray program's
// own messages have always been read, so that frames from any tray, however
// built, mean the same thing on every platform.

#include <cstdint>
#include <string>
#include <string_view>

#include "host/TAVMessage.h"
#include "host/TrayLink.h"
#include "ports/MessageLog.h"
#include "support/DateTime.h"

namespace tav {

// dwData of every frame the player sends.
constexpr uint32_t kCopyDataTag = 3;

// Message types. Types 6, 12 and 15 to 19 are not used.
constexpr int32_t kMsgImmediateShutdown = 1;   // tray to player
constexpr int32_t kMsgTrayIntroduction = 2;    // tray to player
constexpr int32_t kMsgCurrentShow = 3;         // player to tray
constexpr int32_t kMsgNextShow = 4;            // player to tray
constexpr int32_t kMsgReloadSchedules = 5;     // tray to player
constexpr int32_t kMsgLogText = 7;             // player to tray
constexpr int32_t kMsgGracefulShutdown = 8;    // tray to player
constexpr int32_t kMsgShowOnDemand = 9;        // tray to player
constexpr int32_t kMsgPlayerReady = 10;        // player to tray
constexpr int32_t kMsgLeaveOnDemandOnly = 11;  // tray to player
constexpr int32_t kMsgSequenceStart = 13;      // player to tray
constexpr int32_t kMsgSequenceStop = 14;       // player to tray
constexpr int32_t kMsgSimulateInput = 20;      // tray to player

// The two-digit type prefix followed by the body.
std::string TypedMessageText(int32_t type, std::string_view body);

// The frame that carries `text`: dwData 3, the text and its zero byte.
TrayFrame CopyDataFrame(uint32_t senderHwnd, std::string_view text);

// Raw send and typed send from the link's own window. The outcome is not
// examined: a frame to a window that is gone is lost.
void SendRawMessage(TrayLink& link, uint32_t targetHwnd, std::string_view text);
void SendTypedMessage(TrayLink& link, uint32_t targetHwnd, int32_t type, std::string_view body);

// Decodes a received frame: its cbData bytes are copied into a zero-filled
// buffer of at least one byte and the text before the first zero is kept. A
// text without a zero byte fails with the invalid-argument error (5). The
// type is the numeric value of the first two characters (0 when they are no
// number), the body the rest.
TAVMessage DecodeReceivedMessage(const TrayFrame& frame);

// The body of the sequence start and stop messages: the list of the escaped
// file name, the section and the date and time `now`.
std::string SequenceNoticeText(const SequenceIdentity& seqInfo, DateTime now);

// An input a tray fires as if the hardware had raised it.
struct SimulatedInput {
  int32_t network = 0;
  int32_t unitId = 0;
  int32_t inputNumber = 0;
  friend bool operator==(const SimulatedInput&, const SimulatedInput&) = default;
};
// The body of the simulate-input message: the list of the network, the unit
// and the input number, " 0" style numbers: "( 0, 3, 12)".
std::string SimulatedInputText(const SimulatedInput& input);
// Fails with the list errors (1-4), with 37 when the list does not hold
// exactly three fields, and with 13 or 6 for a field that is no 32-bit number.
SimulatedInput SimulatedInputFromText(std::string_view body);

}  // namespace tav
