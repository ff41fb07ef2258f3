#include "suite/channelio/serial/X10UploadDecoder.h"

#include <algorithm>

namespace tav {

std::vector<X10Received> X10UploadDecoder::Decode(std::span<const uint8_t> upload) {
  std::vector<X10Received> received;
  if (upload.empty()) return received;
  const uint8_t mask = upload[0];
  const std::span<const uint8_t> data = upload.subspan(1);
  for (size_t i = 0; i < data.size(); ++i) {
    const int32_t houseNumber = X10FromCode(static_cast<uint8_t>(data[i] >> 4));
    House& house = m_houses[static_cast<size_t>(houseNumber - 1)];
    const bool isFunction = i < 8 && (mask >> i) & 1;
    if (!isFunction) {
      if (house.functionSeen) {
        house.units.clear();
        house.functionSeen = false;
      }
      const int32_t unit = X10FromCode(data[i]);
      if (std::find(house.units.begin(), house.units.end(), unit) == house.units.end())
        house.units.push_back(unit);
      continue;
    }
    X10Received event;
    event.house = houseNumber;
    event.function = static_cast<X10Function>(data[i] & 0xF);
    if (event.function == X10Function::kDim || event.function == X10Function::kBright) {
      // The amount byte belongs to this function whatever its mask bit says.
      if (i + 1 < data.size()) event.dimAmount = data[++i];
    }
    house.functionSeen = true;
    if (house.units.empty()) {
      received.push_back(event);
      continue;
    }
    for (int32_t unit : house.units) {
      event.unit = unit;
      received.push_back(event);
    }
  }
  return received;
}

}  // namespace tav
