#include "suite/seqlib/testing/TempFolder.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace tav {

TempFolder::TempFolder() {
  const char* base = std::getenv("TMPDIR");
  std::string pattern = std::string(base && *base ? base : "/tmp") + "/tav-seq-XXXXXX";
  if (::mkdtemp(pattern.data()) == nullptr)
    throw std::runtime_error("cannot make a temporary folder");
  m_path = pattern + "/";
}

TempFolder::~TempFolder() {
  std::error_code ignored;
  std::filesystem::remove_all(m_path, ignored);
}

std::string TempFolder::Write(const std::string& relative, std::string_view bytes) const {
  std::string path = m_path + relative;
  std::filesystem::create_directories(std::filesystem::path(path).parent_path());
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  if (!out) throw std::runtime_error("cannot write " + path);
  return path;
}

std::string TempFolder::Read(const std::string& relative) const {
  std::ifstream in(m_path + relative, std::ios::binary);
  std::stringstream text;
  text << in.rdbuf();
  return text.str();
}

void TempFolder::SetModified(const std::string& relative, int64_t seconds) const {
  struct timespec times[2];
  times[0].tv_sec = times[1].tv_sec = static_cast<time_t>(seconds);
  times[0].tv_nsec = times[1].tv_nsec = 0;
  if (::utimensat(AT_FDCWD, (m_path + relative).c_str(), times, 0) != 0) {
    throw std::runtime_error("cannot set the time of " + relative);
  }
}

}  // namespace tav
