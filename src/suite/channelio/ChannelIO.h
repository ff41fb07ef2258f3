#pragma once
// Port: the suite's hardware-I/O control as the rest of the player reaches
// it. It holds the lighting networks open, renders and sends light events and
// raises input events. Callers get the narrowest part they need; for now
// that is the keep-alive a loading sequence raises so outputs keep refreshing
// while the program's one thread is busy.

namespace tav {

class ChannelIO {
 public:
  virtual ~ChannelIO() = default;
  // Keeps the outputs alive while the caller blocks the loop for a while.
  virtual void KeepAlive() = 0;
};

}  // namespace tav
