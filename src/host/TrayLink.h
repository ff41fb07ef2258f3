#pragma once
// Port: the link between the player and tray programs, carrying what a
// copy-data window message carries. Each party is a "window" known by a
// non-zero 32-bit handle; the player has one of its own. The link stamps the
// handle of the window a frame came from on every frame it delivers, so no
// tray can speak for another. Sending is fire-and-forget: a frame to a window
// that is gone is lost without an error, as a message to a vanished window is.
//
// Everything runs on the program's one thread: callbacks are called from the
// event loop (or, in the in-process double, from inside the sender's Send).
// A callback may send, and may destroy nothing it did not create.

#include <cstdint>
#include <functional>
#include <string>

namespace tav {

// One copy-data message: the sender's window handle (wParam), dwData, and the
// cbData bytes (cbData is data.size()).
struct TrayFrame {
  uint32_t senderHwnd = 0;
  uint32_t dwData = 0;
  std::string data;

  friend bool operator==(const TrayFrame&, const TrayFrame&) = default;
};

class TrayLink {
 public:
  virtual ~TrayLink() = default;

  // The player's own window handle; never 0.
  virtual uint32_t OwnHandle() const = 0;

  // Sends `frame` as it is to the window `targetHwnd`. Returns false when no
  // such window is connected (the frame is lost, nothing fails).
  virtual bool Send(uint32_t targetHwnd, const TrayFrame& frame) = 0;

  // Called for every frame received, its senderHwnd stamped by the link.
  virtual void SetOnFrame(std::function<void(const TrayFrame&)> onFrame) = 0;
  // Called when a window appears and when it goes (with a short reason such
  // as "closed" or "oversized frame").
  virtual void SetOnConnect(std::function<void(uint32_t hwnd)> onConnect) = 0;
  virtual void SetOnDisconnect(
      std::function<void(uint32_t hwnd, const std::string& reason)> onDisconnect) = 0;
};

}  // namespace tav
