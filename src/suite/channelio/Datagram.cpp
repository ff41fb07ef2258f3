#include "suite/channelio/Datagram.h"

#include <charconv>

namespace tav {

std::string IPv4Endpoint::ToString() const {
  return std::to_string(address[0]) + "." + std::to_string(address[1]) + "." +
         std::to_string(address[2]) + "." + std::to_string(address[3]) + ":" + std::to_string(port);
}

namespace {

// A decimal number of at most `digits` digits and at most `max`.
bool ReadNumber(std::string_view& text, int digits, uint32_t max, uint32_t& value) {
  size_t length = 0;
  while (length < text.size() && text[length] >= '0' && text[length] <= '9') ++length;
  if (length == 0 || length > static_cast<size_t>(digits)) return false;
  std::from_chars(text.data(), text.data() + length, value);
  text.remove_prefix(length);
  return value <= max;
}

}  // namespace

bool ParseIPv4Endpoint(std::string_view text, uint16_t defaultPort, IPv4Endpoint& endpoint) {
  IPv4Endpoint parsed;
  for (int i = 0; i < 4; ++i) {
    uint32_t octet = 0;
    if (!ReadNumber(text, 3, 255, octet)) return false;
    parsed.address[i] = static_cast<uint8_t>(octet);
    if (i < 3) {
      if (text.empty() || text.front() != '.') return false;
      text.remove_prefix(1);
    }
  }
  parsed.port = defaultPort;
  if (!text.empty()) {
    if (text.front() != ':') return false;
    text.remove_prefix(1);
    uint32_t port = 0;
    if (!ReadNumber(text, 5, 65535, port) || port == 0 || !text.empty()) return false;
    parsed.port = static_cast<uint16_t>(port);
  }
  endpoint = parsed;
  return true;
}

}  // namespace tav
