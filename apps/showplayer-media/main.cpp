// showplayer-media: the media process of the show player. The player starts
// it with one end of a socket pair and tells it what to play; it plays on
// libmpv and reports back (docs/media-process.md). It lives apart from the
// player so that libmpv's memory and threads, and any crash in a decoder or
// a sound driver, stay out of the process that drives the lights.

#include <sys/prctl.h>
#include <sys/stat.h>

#include <CLI/CLI.hpp>
#include <csignal>
#include <cstdio>

#include "MediaServer.h"
#include "platform/EventLoop.h"

int main(int argc, char** argv) {
  CLI::App app{
      "showplayer-media - the media process of the show player: plays music and video for it.\n"
      "The player starts it; it is not meant to be run by hand."};
  app.set_version_flag("--version", std::string("showplayer-media ") + TAV_VERSION);
  int fd = -1;
  app.add_option("--fd", fd, "the descriptor of the player's socket")->required();
  CLI11_PARSE(app, argc, argv);

  struct stat info {};
  if (fd < 0 || ::fstat(fd, &info) != 0 || !S_ISSOCK(info.st_mode)) {
    std::fprintf(stderr, "showplayer-media: descriptor %d is not a socket\n", fd);
    return 2;
  }
  // Music must not play on without the lights: end with the player, even
  // when this process is too busy to notice that the link has closed.
  ::prctl(PR_SET_PDEATHSIG, SIGKILL);
  // A player that has gone is seen as an error on the link, not a signal.
  std::signal(SIGPIPE, SIG_IGN);
  // Ended by the player, not by a stop meant for the player: a service
  // manager that stops the whole group lets the player shut down in order,
  // and this process follows when the link closes.
  std::signal(SIGTERM, SIG_IGN);
  std::signal(SIGINT, SIG_IGN);

  tav::EventLoop loop;
  tav::MediaServer server(loop, fd);
  loop.Run();
  return server.ExitStatus();
}
