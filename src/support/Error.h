#pragma once
// The one exception type of the player. Every failure carries a number, a
// source (the qualified procedure name, such as "Schedule.AddShowEvent") and
// a description, because handlers log exactly those and tests compare them.
// Data classes throw; timer ticks and message handlers catch at their edge.

#include <cstdint>
#include <stdexcept>
#include <string>

namespace tav {

class Error : public std::runtime_error {
 public:
  Error(int32_t number, std::string source, std::string description);

  int32_t Number() const { return m_number; }
  const std::string& Source() const { return m_source; }
  const std::string& Description() const { return m_description; }

 private:
  int32_t m_number;
  std::string m_source;
  std::string m_description;
};

// The platform's standard errors keep their numbers and words, since logs and
// the tray show them as users have always seen them.
namespace errors {
constexpr int32_t kInvalidProcedureCall = 5;
constexpr int32_t kOverflow = 6;
constexpr int32_t kSubscriptOutOfRange = 9;
constexpr int32_t kTypeMismatch = 13;
constexpr int32_t kObjectNotSet = 91;
constexpr int32_t kKeyAlreadyAssociated = 457;

// The source a runtime error reports when the failing procedure gave none.
inline constexpr const char* kDefaultSource = "ShowPlayer";

Error InvalidProcedureCall(std::string source = kDefaultSource);
Error Overflow(std::string source = kDefaultSource);
Error SubscriptOutOfRange(std::string source = kDefaultSource);
Error TypeMismatch(std::string source = kDefaultSource);
Error ObjectNotSet(std::string source = kDefaultSource);
Error KeyAlreadyAssociated(std::string source = kDefaultSource);
}  // namespace errors

}  // namespace tav
