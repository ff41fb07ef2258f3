#pragma once
// The link to one running media process at a time: starts the program with
// one end of a socket pair (posix_spawn, without waiting for it), writes
// commands in order without blocking, reads its lines and decodes them, and
// checks that it is alive: it must greet first, speaking our version of the
// protocol, and answer each ping within answerBound. What concerns the play
// (states, clock reports, errors) is handed to the owner as it comes; the
// greeting, the answers and the log lines of the media process are dealt
// with here.
//
// A media process that ends, writes what cannot be read, stops reading, or
// leaves a ping unanswered is ended (killed, or reaped once it has gone),
// one line saying why is logged, and the owner is told what to say of a
// play that was going. Quit ends it in order without telling the owner.
//
// Owned by MediaProcessPlayer; the EventLoop and the MessageLog must outlive
// it. Used on the loop's thread only. The owner's handlers may be called
// from within Send (a media process that stopped reading is ended there) and
// must not destroy the link. Destroying it quits the media process and
// waits for it at most quitWait before killing it.

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "platform/EventLoop.h"
#include "platform/media/MediaProtocol.h"
#include "platform/media/MpvOutputs.h"
#include "ports/MessageLog.h"

namespace tav {

class MediaProcessLink {
 public:
  using Clock = std::chrono::steady_clock;

  struct Timing {
    std::chrono::milliseconds pingInterval{1000};
    std::chrono::milliseconds answerBound{3000};
    std::chrono::milliseconds quitWait{1000};
  };

  // A message about the play: whatever the media process sends after its
  // greeting, other than answers, log lines and its own failure.
  using OnMessage = std::function<void(const MediaMessage& message)>;
  // The media process has been ended: `reason` says why the play that was
  // going cannot be heard, `lived` how long the media process ran.
  using OnEnded = std::function<void(const std::string& reason, Clock::duration lived)>;

  // "1 s", "1500 ms": how long, as the log lines say it.
  static std::string DurationText(Clock::duration duration);

  // Each media process started is first told `outputs`.
  MediaProcessLink(EventLoop& loop, MessageLog& log, const MpvOutputs& outputs, std::string program,
                   const Timing& timing);
  ~MediaProcessLink();
  MediaProcessLink(const MediaProcessLink&) = delete;
  MediaProcessLink& operator=(const MediaProcessLink&) = delete;

  void SetOnMessage(OnMessage handler);
  void SetOnEnded(OnEnded handler);

  // Starts a media process when none runs. Fails with an Error saying why
  // when the program is missing or cannot start.
  void Start();
  bool Running() const;
  // The running media process, 0 when none.
  int64_t ProcessId() const;

  // Queues `message` for the running media process; nothing when none.
  void Send(const MediaMessage& message);
  // Ends the running media process in order: it is told to quit, then
  // reaped, and killed if it has not gone within quitWait.
  void Quit();
  // Quits and blocks until every media process started has been reaped:
  // for shutting down only.
  void Close();

 private:
  struct State;
  std::shared_ptr<State> m_state;
};

}  // namespace tav
