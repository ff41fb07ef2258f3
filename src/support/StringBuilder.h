#pragma once
// An accumulating string for texts built piecewise (log buffers, list texts).

#include <string>
#include <string_view>

namespace tav {

class StringBuilder {
 public:
  void Append(std::string_view text) { m_text.append(text); }
  bool IsEmpty() const { return m_text.empty(); }
  void Reset() { m_text.clear(); }
  const std::string& ToString() const { return m_text; }
  size_t Length() const { return m_text.size(); }

 private:
  std::string m_text;
};

}  // namespace tav
