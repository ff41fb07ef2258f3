#include "suite/seqlib/SeqErrors.h"

namespace tav::seqerrors {

Error FileNotFound(std::string source, const std::string& path) {
  return Error(kFileNotFound, std::move(source), "File not found: " + path);
}

Error PastEndOfFile(std::string source, const std::string& what) {
  return Error(kPastEndOfFile, std::move(source), "Input past end of file: " + what);
}

Error FileAccess(std::string source, const std::string& what) {
  return Error(kFileAccess, std::move(source), "Path/File access error: " + what);
}

Error InvalidFormat(std::string source, const std::string& what) {
  return Error(kInvalidFileFormat, std::move(source), "Invalid file format: " + what);
}

}  // namespace tav::seqerrors
