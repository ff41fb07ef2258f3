#pragma once
// The sequence library's FileSystem on the local disk, through POSIX calls.
// Stateless, so one shared instance serves everybody.

#include <memory>

#include "suite/seqlib/FileSystem.h"

namespace tav {

std::shared_ptr<FileSystem> LocalFileSystem();

}  // namespace tav
