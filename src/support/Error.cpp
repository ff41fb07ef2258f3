#include "support/Error.h"

namespace tav {

Error::Error(int32_t number, std::string source, std::string description)
    : std::runtime_error(description),
      m_number(number),
      m_source(std::move(source)),
      m_description(std::move(description)) {}

namespace errors {

Error InvalidProcedureCall(std::string source) {
  return Error(kInvalidProcedureCall, std::move(source), "Invalid procedure call or argument");
}
Error Overflow(std::string source) {
  return Error(kOverflow, std::move(source), "Overflow");
}
Error SubscriptOutOfRange(std::string source) {
  return Error(kSubscriptOutOfRange, std::move(source), "Subscript out of range");
}
Error TypeMismatch(std::string source) {
  return Error(kTypeMismatch, std::move(source), "Type mismatch");
}
Error ObjectNotSet(std::string source) {
  return Error(kObjectNotSet, std::move(source), "Object variable or With block variable not set");
}
Error KeyAlreadyAssociated(std::string source) {
  return Error(kKeyAlreadyAssociated, std::move(source),
               "This key is already associated with an element of this collection");
}

}  // namespace errors
}  // namespace tav
