#pragma once
// The sequence library's FileSystem on the local disk, through POSIX calls.
// Stateless, so one shared instance serves everybody. Writes replace files
// whole (ReplaceFileContents); at start the program clears the sequence
// folder of temporaries a crash left (RemoveStaleTemporaries, PosixFiles.h).

#include <memory>

#include "suite/seqlib/FileSystem.h"

namespace tav {

std::shared_ptr<FileSystem> LocalFileSystem();

}  // namespace tav
