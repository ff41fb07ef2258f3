#include "support/testing/TempFolder.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>
#include <stdexcept>

namespace tav {

namespace fs = std::filesystem;

TempFolder::TempFolder(std::string_view prefix) {
  std::random_device seed;
  std::mt19937_64 random(seed());
  fs::path base = fs::temp_directory_path();
  for (int attempt = 0; attempt < 100; ++attempt) {
    fs::path candidate = base / (std::string(prefix) + "-" + std::to_string(random() % 1000000000));
    std::error_code error;
    if (fs::create_directory(candidate, error)) {
      m_path = candidate.string() + "/";
      return;
    }
  }
  throw std::runtime_error("cannot make a temporary folder under " + base.string());
}

TempFolder::~TempFolder() {
  std::error_code ignored;
  fs::remove_all(m_path, ignored);
}

std::string TempFolder::Write(const std::string& relative, std::string_view bytes) const {
  std::string path = m_path + relative;
  fs::create_directories(fs::path(path).parent_path());
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

bool TempFolder::Exists(const std::string& relative) const {
  std::error_code ignored;
  return fs::exists(m_path + relative, ignored);
}

void TempFolder::SetModified(const std::string& relative, int64_t seconds) const {
  // file_time_type's epoch is not the Unix epoch; go through the system clock.
  auto wanted = std::chrono::system_clock::time_point(std::chrono::seconds(seconds));
  auto fileTime = std::chrono::file_clock::from_sys(wanted);
  std::error_code error;
  fs::last_write_time(m_path + relative, fileTime, error);
  if (error) throw std::runtime_error("cannot set the time of " + relative);
}

}  // namespace tav
