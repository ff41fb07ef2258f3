// Time per byte of ListFromText on record-shaped lists from 10 KB to 10 MB.
// The reader must stay linear: the 10 MB figure has to be within 1.5x of the
// 10 KB figure. Exits non-zero when it is not.

#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

#include "support/Serialize.h"

namespace {

// A list of nested records shaped like schedule entries, about `bytes` long.
std::string MakeList(size_t bytes) {
  std::vector<std::string> fields;
  size_t total = 2;
  for (int i = 0; total < bytes; ++i) {
    std::string record = tav::ListToText(
        {tav::EscapeText("Show number " + std::to_string(i) + ".tss"),
         "(T,2024-12-24 18:00:00,T,2024-12-24 22:00:00)", tav::LongToText(i % 3), "F"});
    total += record.size() + 1;
    fields.push_back(std::move(record));
  }
  return tav::ListToText(fields);
}

double NanosecondsPerByte(const std::string& text) {
  using Clock = std::chrono::steady_clock;
  // Repeat until at least 0.3 s has passed so small sizes are measured well.
  size_t rounds = 0, fields = 0;
  auto start = Clock::now();
  auto elapsed = Clock::duration::zero();
  do {
    fields += static_cast<size_t>(tav::ArrayCount(tav::ListFromText(text, 1)));
    ++rounds;
    elapsed = Clock::now() - start;
  } while (elapsed < std::chrono::milliseconds(300));
  if (fields == 0) std::puts("no fields?");
  double ns = std::chrono::duration<double, std::nano>(elapsed).count();
  return ns / (static_cast<double>(rounds) * static_cast<double>(text.size()));
}

}  // namespace

int main() {
  const size_t sizes[] = {10'000, 100'000, 1'000'000, 10'000'000};
  std::printf("%12s %14s\n", "list bytes", "ns per byte");
  double first = 0, last = 0;
  for (size_t size : sizes) {
    std::string text = MakeList(size);
    double perByte = NanosecondsPerByte(text);
    std::printf("%12zu %14.3f\n", text.size(), perByte);
    if (first == 0) first = perByte;
    last = perByte;
  }
  double ratio = last / first;
  std::printf("10 MB / 10 KB time per byte: %.2fx (limit 1.5x)\n", ratio);
  return ratio <= 1.5 ? 0 : 1;
}
