#include "suite/channelio/serial/testing/FakeSerialLink.h"

#include <algorithm>

#include "support/Error.h"

namespace tav {

bool FakeSerialLink::Accept(std::span<const uint8_t> bytes, uint32_t breakMicros,
                            uint32_t markMicros) {
  if (!m_connected || m_refuse) return false;
  m_writes.push_back({std::vector<uint8_t>(bytes.begin(), bytes.end()), breakMicros, markMicros});
  if (m_onWrite) m_onWrite(bytes);
  return true;
}

bool FakeSerialLink::Write(std::span<const uint8_t> bytes) {
  return Accept(bytes, 0, 0);
}

bool FakeSerialLink::WriteAfterBreak(std::span<const uint8_t> bytes, uint32_t breakMicros,
                                     uint32_t markMicros) {
  return Accept(bytes, breakMicros, markMicros);
}

void FakeSerialLink::Receive(std::vector<uint8_t> bytes) {
  if (m_onReceive) m_onReceive(bytes);
}

void FakeSerialLink::Unplug(const std::string& reason) {
  m_connected = false;
  if (m_onConnectionChange) m_onConnectionChange(false, reason);
}

void FakeSerialLink::Replug() {
  m_connected = true;
  if (m_onConnectionChange) m_onConnectionChange(true, "");
}

void FakeSerialLink::SetQueued(size_t bytes, bool refuse) {
  m_queued = bytes;
  m_refuse = refuse;
}

std::vector<uint8_t> FakeSerialLink::Bytes() const {
  std::vector<uint8_t> all;
  for (const auto& write : m_writes) all.insert(all.end(), write.bytes.begin(), write.bytes.end());
  return all;
}

std::unique_ptr<SerialLink> FakeSerialPortOpener::Open(const SerialSettings& settings) {
  auto contains = [&](const std::vector<std::string>& list) {
    return std::find(list.begin(), list.end(), settings.path) != list.end();
  };
  if (contains(held)) throw Error(kErrorPortAlreadyOpen, "SerialPort.Open", kPortAlreadyOpenText);
  if (contains(missing))
    throw Error(kErrorPortInvalid, "SerialPort.Open",
                "Serial port " + settings.path + " does not exist");
  opened.push_back(settings);
  auto link = std::make_unique<FakeSerialLink>();
  links.push_back(link.get());
  return link;
}

}  // namespace tav
