#pragma once
// Starting and ending a child program that talks over a socket: the child
// gets one end of a socket pair as a fixed file descriptor, standard input
// from /dev/null, the player's standard output and error, and no other
// descriptor of the player's. It runs in a process group of its own, so that
// a Ctrl-C meant for the player does not reach it: it ends when the player
// closes its end. Nothing here waits for the child.

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace tav {

struct SpawnedChild {
  int64_t processId = 0;
  int socket = -1;  // the player's end: close-on-exec, owned by the caller
};

// Starts `program` with `arguments` (after the program's name) and the other
// end of the socket pair as descriptor `childSocket` (3 or more). Fails with
// an Error (5) saying why.
SpawnedChild SpawnWithSocket(const std::string& program, const std::vector<std::string>& arguments,
                             int childSocket);

// How the child ended ("exited with status 1", "killed by signal 9
// (Killed)"), nothing while it runs, or "" when it is not our child (reaped
// already).
std::optional<std::string> TryReapChild(int64_t processId);

// SIGKILL to a child not yet reaped.
void KillChild(int64_t processId);

}  // namespace tav
