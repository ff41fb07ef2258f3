#include "host/Msg.h"

#include "support/Error.h"
#include "support/Numbers.h"
#include "support/Serialize.h"

namespace tav {

std::string TypedMessageText(int32_t type, std::string_view body) {
  std::string text;
  text.reserve(body.size() + 2);
  if (type >= 1 && type <= 9) {
    text += '0';
    text += static_cast<char>('0' + type);
  } else if (type >= 10 && type <= 99) {
    text += std::to_string(type);
  } else {
    text += "00";
  }
  text.append(body);
  return text;
}

TrayFrame CopyDataFrame(uint32_t senderHwnd, std::string_view text) {
  TrayFrame frame;
  frame.senderHwnd = senderHwnd;
  frame.dwData = kCopyDataTag;
  frame.data.reserve(text.size() + 1);
  frame.data.append(text);
  frame.data.push_back('\0');
  return frame;
}

void SendRawMessage(TrayLink& link, uint32_t targetHwnd, std::string_view text) {
  link.Send(targetHwnd, CopyDataFrame(link.OwnHandle(), text));
}

void SendTypedMessage(TrayLink& link, uint32_t targetHwnd, int32_t type, std::string_view body) {
  SendRawMessage(link, targetHwnd, TypedMessageText(type, body));
}

TAVMessage DecodeReceivedMessage(const TrayFrame& frame) {
  // An empty block still reads as one zero byte: an empty text, type 0.
  std::string_view block = frame.data;
  if (block.empty()) block = std::string_view("\0", 1);
  size_t zero = block.find('\0');
  if (zero == std::string_view::npos)
    throw errors::InvalidProcedureCall("Msg.DecodeReceivedMessage");
  std::string_view text = block.substr(0, zero);

  TAVMessage message;
  message.SetSenderHwnd(frame.senderHwnd);
  message.SetMessageType(NumberOf(text.substr(0, 2)));
  message.SetText(std::string(text.size() > 2 ? text.substr(2) : std::string_view()));
  return message;
}

std::string SequenceNoticeText(const SequenceIdentity& seqInfo, DateTime now) {
  return ListToText(
      {EscapeText(seqInfo.Filename()), LongToText(seqInfo.Section()), DateToText(now)});
}

std::string SimulatedInputText(const SimulatedInput& input) {
  return ListToText(
      {LongToText(input.network), LongToText(input.unitId), LongToText(input.inputNumber)});
}

SimulatedInput SimulatedInputFromText(std::string_view body) {
  TextArray fields = ListFromText(body, 0);
  int32_t count = ArrayCount(fields);
  if (count != 3) {
    throw Error(37, "Msg.SimulatedInputFromText",
                "Unexpected number of fields in simulated input: " + std::to_string(count));
  }
  return {LongFromText(fields[0]), LongFromText(fields[1]), LongFromText(fields[2])};
}

}  // namespace tav
