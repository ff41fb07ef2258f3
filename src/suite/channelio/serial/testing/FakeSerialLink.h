#pragma once
// Test double for the SerialLink port: records every write (and the break
// before it), lets a test play the device's answers, unplug and replug it,
// and fill its queue. Callbacks run inside the test's calls, which stands in
// for the loop.

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "suite/channelio/serial/SerialLink.h"

namespace tav {

struct FakeSerialWrite {
  std::vector<uint8_t> bytes;
  uint32_t breakMicros = 0;  // 0: a plain write
  uint32_t markMicros = 0;
};

class FakeSerialLink : public SerialLink {
 public:
  bool Write(std::span<const uint8_t> bytes) override;
  bool WriteAfterBreak(std::span<const uint8_t> bytes, uint32_t breakMicros,
                       uint32_t markMicros) override;
  size_t QueuedBytes() const override { return m_queued; }
  bool Connected() const override { return m_connected; }
  void SetOnReceive(std::function<void(std::span<const uint8_t>)> handler) override {
    m_onReceive = std::move(handler);
  }
  void SetOnConnectionChange(
      std::function<void(bool connected, const std::string& reason)> handler) override {
    m_onConnectionChange = std::move(handler);
  }

  // The device sends these bytes.
  void Receive(std::vector<uint8_t> bytes);
  void Unplug(const std::string& reason = "Input/output error");
  void Replug();
  // Pretends this many bytes wait in the queue; with `refuse`, writes fail.
  void SetQueued(size_t bytes, bool refuse = false);
  // Called with each accepted write, after it is recorded (a device model).
  void SetOnWrite(std::function<void(std::span<const uint8_t>)> handler) {
    m_onWrite = std::move(handler);
  }

  const std::vector<FakeSerialWrite>& Writes() const { return m_writes; }
  // Every byte written, in order.
  std::vector<uint8_t> Bytes() const;
  void ClearWrites() { m_writes.clear(); }

 private:
  bool Accept(std::span<const uint8_t> bytes, uint32_t breakMicros, uint32_t markMicros);

  std::vector<FakeSerialWrite> m_writes;
  size_t m_queued = 0;
  bool m_refuse = false;
  bool m_connected = true;
  std::function<void(std::span<const uint8_t>)> m_onReceive;
  std::function<void(bool, const std::string&)> m_onConnectionChange;
  std::function<void(std::span<const uint8_t>)> m_onWrite;
};

// Opens FakeSerialLinks and keeps a pointer to each for the test; paths in
// `held` fail with 8005, paths in `missing` with 8002.
class FakeSerialPortOpener : public SerialPortOpener {
 public:
  std::unique_ptr<SerialLink> Open(const SerialSettings& settings) override;

  std::vector<std::string> held;
  std::vector<std::string> missing;
  std::vector<SerialSettings> opened;
  std::vector<FakeSerialLink*> links;  // owned by whoever opened them
};

}  // namespace tav
