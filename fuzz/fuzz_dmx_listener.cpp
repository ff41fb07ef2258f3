// The DMX listener on arbitrary datagrams: the E1.31 and Art-Net readers
// and the receiver rules behind them. The input is cut into datagrams at
// each "\xff\xfe\xfd" marker so one run can feed a sequence of packets
// (sources coming and going, sequence numbers, terminations). Nothing may
// crash, read outside a datagram or grow without bound, and every reading
// must stay inside what it was given.

#include <cstdlib>
#include <vector>

#include "FuzzCommon.h"
#include "suite/channelio/ArtNetPacket.h"
#include "suite/channelio/DMXListener.h"
#include "suite/channelio/E131Packet.h"

namespace {

void CheckReaders(const uint8_t* data, size_t size) {
  tav::E131DataView e131;
  if (tav::ParseE131(data, size, e131) == tav::E131Parse::kData) {
    if (e131.slotCount > 512 || e131.slots + e131.slotCount != data + size) std::abort();
    if (e131.universe < 1 || e131.universe > 63999) std::abort();
  }
  tav::ArtDmxView artnet;
  if (tav::ParseArtNet(data, size, artnet) == tav::ArtNetParse::kDmx) {
    if (artnet.length < 2 || artnet.length > 512 || artnet.data + artnet.length > data + size)
      std::abort();
  }
}

void FuzzOne(std::string_view input) {
  std::vector<std::string_view> datagrams;
  std::string_view rest = input;
  for (;;) {
    size_t cut = rest.find("\xff\xfe\xfd");
    datagrams.push_back(rest.substr(0, cut));
    if (cut == std::string_view::npos) break;
    rest.remove_prefix(cut + 3);
  }
  tav::DMXListener::Settings e131;
  e131.universe = 1;
  e131.firstSlot = 1;
  e131.slotCount = 512;
  tav::DMXListener::Settings artnet = e131;
  artnet.protocol = tav::DMXProtocol::kArtNet;
  artnet.universe = 0;
  tav::DMXListener listeners[] = {tav::DMXListener(e131), tav::DMXListener(artnet)};
  std::vector<int32_t> pressed;
  uint32_t tick = 0;
  for (std::string_view d : datagrams) {
    const auto* bytes = reinterpret_cast<const uint8_t*>(d.data());
    CheckReaders(bytes, d.size());
    for (auto& listener : listeners) {
      listener.Receive({bytes, d.size(), false, {{10, 0, 0, 1}, 5568}}, tick, pressed);
      if (listener.SourceCount() > tav::DMXListener::kMaxSources) std::abort();
    }
    tick += 700;  // sources time out every few datagrams
  }
  for (int32_t slot : pressed) {
    if (slot < 1 || slot > 512) std::abort();
  }
}

}  // namespace

TAV_FUZZ_TARGET(FuzzOne(input))
