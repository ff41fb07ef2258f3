#include <gmock/gmock.h>

#include <nlohmann/json.hpp>

#include "ShowctlRunner.h"
#include "config/LibRegistry.h"
#include "config/NetworkPreferences.h"
#include "platform/FileRegistryStore.h"

namespace tav::showctl::testing {
namespace {

using nlohmann::json;
using ::testing::HasSubstr;
using ::testing::Not;

class NetworkCommand : public ShowctlTest {
 protected:
  // The preferences as the player reads them from the settings file.
  NetworkPreferences Stored() const {
    FileRegistryStore store(Path("registry.reg"));
    NetworkPreferences prefs;
    prefs.InitFromRegistry(store);
    return prefs;
  }
  std::string Ver() const {
    FileRegistryStore store(Path("registry.reg"));
    return GetStringSetting(store, "Ver", "Network", "");
  }
  json List() const {
    Result r = Run({"network", "list", "--json"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    return json::parse(r.out);
  }
  void Ok(const std::vector<std::string>& args) const {
    Result r = Run(args);
    ASSERT_EQ(r.exitCode, 0) << args[1] << ": " << r.err;
  }
};

TEST_F(NetworkCommand, AChangeIsSavedWhereThePlayerReadsItAndAnnouncedWithANewVer) {
  Ok({"settings", "set", "MonitorRestart", "false", "-s", "MonitorMemory"});
  Result r = Run({"network", "tav", "3", "--port", "/dev/ttyUSB0", "--speed", "115200",
                  "--enhanced", "on", "--dmx-universe", "9", "--dmx-start-slot", "17"});
  ASSERT_EQ(r.exitCode, 0) << r.err;
  EXPECT_THAT(r.out, HasSubstr("/dev/ttyUSB0"));
  EXPECT_THAT(r.err, Not(HasSubstr("warning")));

  NetworkPreferences prefs = Stored();
  EXPECT_EQ(prefs.TAVNetwork(3).Port(), "/dev/ttyUSB0");
  EXPECT_EQ(prefs.TAVNetwork(3).Speed(), 115200);
  EXPECT_TRUE(prefs.TAVNetwork(3).Enhanced());
  EXPECT_FALSE(prefs.TAVNetwork(3).OldMCP());
  EXPECT_EQ(prefs.TAVNetwork(3).DMXUniverse(), 9);
  EXPECT_EQ(prefs.TAVNetwork(3).DMXStartSlot(), 17);
  EXPECT_EQ(prefs.TAVNetwork(2), TAVNetworkPreferences());
  std::string firstVer = Ver();
  EXPECT_FALSE(firstVer.empty());

  Ok({"network", "x10", "--port", "/dev/ttyS1", "--house-codes", "acp"});
  Ok({"network", "fennick", "--port", "/dev/ttyUSB2", "--boards", "4", "--clamp-special-values",
      "on"});
  Ok({"network", "listener", "--enabled", "on", "--transport", "artnet", "--universe", "64",
      "--first-slot", "10", "--slot-count", "8", "--network", "2", "--unit", "5"});
  Ok({"network", "output", "--source-name", "Front yard", "--ttl", "4", "--sync-universe", "7000",
      "--source-cid", "{6f1c2d3e-0a1b-4c5d-8e9f-a0b1c2d3e4f5}"});
  Ok({"network", "tav", "3", "--port", ""});
  prefs = Stored();
  EXPECT_EQ(prefs.TAVNetwork(3).Port(), "");
  EXPECT_EQ(prefs.TAVNetwork(3).Speed(), 115200);  // untouched by the later change
  EXPECT_EQ(prefs.X10HouseCodes(), "ACP");
  EXPECT_EQ(prefs.FennickPort(), "/dev/ttyUSB2");
  EXPECT_EQ(prefs.Fennick().Boards(), 4);
  EXPECT_TRUE(prefs.Fennick().ClampSpecialValues());
  EXPECT_TRUE(prefs.Listener().Enabled());
  EXPECT_EQ(prefs.Listener().Transport(), DMXTransport::kArtNet);
  EXPECT_EQ(prefs.Listener().Unit(), 5);
  EXPECT_EQ(prefs.SourceName(), "Front yard");
  EXPECT_EQ(prefs.MulticastTTL(), 4);
  EXPECT_EQ(prefs.SyncUniverse(), 7000);
  EXPECT_TRUE(prefs.Problems().empty());
  EXPECT_NE(Ver(), firstVer);

  // The rest of the settings file is left as it was.
  EXPECT_EQ(Run({"settings", "get", "MonitorRestart", "-s", "MonitorMemory"}).out, "false\n");
}

TEST_F(NetworkCommand, ChangesMadeAtTheSameTimeAreAllKept) {
  std::vector<std::vector<std::string>> commands;
  for (int network = 0; network < 6; ++network) {
    commands.push_back({"network", "tav", std::to_string(network), "--speed",
                        std::to_string(9600 * (network + 1))});
  }
  commands.push_back({"network", "universe", "add", "1-4"});
  commands.push_back({"network", "output", "--ttl", "9"});
  ASSERT_TRUE(RunAtOnce(commands));
  NetworkPreferences prefs = Stored();
  for (int network = 0; network < 6; ++network) {
    EXPECT_EQ(prefs.TAVNetwork(network).Speed(), 9600 * (network + 1)) << network;
  }
  EXPECT_EQ(prefs.DMXUniverseCount(), 4);
  EXPECT_EQ(prefs.MulticastTTL(), 9);
}

TEST_F(NetworkCommand, ShowingOrRepeatingAValueWritesNothing) {
  EXPECT_EQ(Run({"network", "tav", "0"}).exitCode, 0);
  EXPECT_EQ(Run({"network", "list"}).exitCode, 0);
  EXPECT_FALSE(std::filesystem::exists(Path("registry.reg")));

  Ok({"network", "output", "--refresh-rate", "44"});
  const std::string before = Read("registry.reg");
  Result again = Run({"network", "output", "--refresh-rate", "44"});
  EXPECT_EQ(again.exitCode, 0);
  EXPECT_THAT(again.out, HasSubstr("no change"));
  EXPECT_EQ(Read("registry.reg"), before);  // Ver included: the player is not disturbed
}

TEST_F(NetworkCommand, BadValuesAreRefusedWithTheReasonAndChangeNothing) {
  Ok({"network", "universe", "add", "1-2"});
  const std::string before = Read("registry.reg");
  const struct {
    std::vector<std::string> args;
    std::string message;
  } cases[] = {
      {{"tav", "3", "--speed", "5"}, "TAV network 3 speed is 5, outside 300-4000000"},
      {{"tav", "3", "--speed", "fast"}, "--speed: \"fast\" is not a whole number"},
      {{"tav", "16", "--speed", "9600"}, "numbered 0 to 15, not 16"},
      {{"tav", "0", "--stop-bits", "3"}, "stop bits is 3, outside 1-2"},
      {{"tav", "0", "--old-mcp", "maybe"}, "--old-mcp: \"maybe\" is not a boolean"},
      // Two values at once: the good one is not saved either.
      {{"tav", "0", "--port", "/dev/ttyS0", "--units", "0"}, "units is 0, outside 1-127"},
      {{"universe", "add", "0"}, "universe is 0, outside 1-63999"},
      {{"universe", "add", "5", "--priority", "201"},
       "DMX universe 5 priority is 201, outside 0-200"},
      {{"universe", "add", "5", "--transport", "usbpro"}, "needs a serial port"},
      {{"universe", "add", "5", "--transport", "dmx512"}, "is not a transport"},
      {{"universe", "add", "2-3"}, "universe 2 is already in the list"},
      {{"universe", "add", "9-5"}, "counts down"},
      {{"universe", "add", "1-60000"}, "more than 1024 universes"},
      {{"universe", "set", "3", "--size", "9"}, "universe 3 is not in the list"},
      {{"universe", "set", "1", "--size", "513"}, "size is 513, outside 1-512"},
      {{"universe", "set", "1", "--universe", "2"}, "universe 2 is already in the list"},
      {{"universe", "set", "1-2", "--universe", "7"}, "give a single"},
      {{"universe", "remove", "1-3"}, "universe 3 is not in the list"},
      {{"x10", "--house-codes", "AZ"}, "X10 house code 'Z' is not a letter A-P"},
      {{"fennick", "--channels-per-board", "0"}, "Fennick channels per board is 0"},
      {{"listener", "--threshold", "0"}, "listener threshold is 0, outside 1-255"},
      {{"listener", "--transport", "opendmx"}, "receives E1.31 or ArtNet only"},
      {{"output", "--ttl", "256"}, "multicast TTL is 256, outside 1-255"},
      {{"output", "--source-name", std::string(64, 'x')}, "64 bytes long"},
      {{"output", "--source-cid", "not-a-uuid"}, "is not a UUID"},
  };
  for (const auto& c : cases) {
    std::vector<std::string> args = {"network"};
    args.insert(args.end(), c.args.begin(), c.args.end());
    Result r = Run(args);
    EXPECT_EQ(r.exitCode, 1) << c.message;
    EXPECT_THAT(r.err, HasSubstr(c.message));
    EXPECT_EQ(Read("registry.reg"), before) << c.message;
  }
}

TEST_F(NetworkCommand, UniverseRangesTakeConsecutiveChannels) {
  Ok({"network", "universe", "add", "1-16", "--transport", "e1.31"});
  Ok({"network", "universe", "add", "20-21", "--transport", "artnet", "--size", "170",
      "--destination", "10.0.0.7"});
  json dmx = List()["DMX"];
  ASSERT_EQ(dmx.size(), 18u);
  for (int i = 0; i < 16; ++i) {
    EXPECT_EQ(dmx[i]["Universe"], i + 1);
    EXPECT_EQ(dmx[i]["StartChannel"], i * 512 + 1);
    EXPECT_EQ(dmx[i]["Transport"], "E1.31");
  }
  EXPECT_EQ(dmx[16]["StartChannel"], 16 * 512 + 1);  // after the universes already there
  EXPECT_EQ(dmx[17]["StartChannel"], 16 * 512 + 171);
  EXPECT_EQ(dmx[17]["Destination"], "10.0.0.7");

  Ok({"network", "universe", "set", "20-21", "--start-channel", "100000", "--enabled", "off"});
  Ok({"network", "universe", "remove", "3-16"});
  Ok({"network", "universe", "set", "2", "--universe", "3"});
  dmx = List()["DMX"];
  ASSERT_EQ(dmx.size(), 4u);
  EXPECT_EQ(dmx[1]["Universe"], 3);
  EXPECT_EQ(dmx[1]["StartChannel"], 513);
  EXPECT_EQ(dmx[2]["StartChannel"], 100000);
  EXPECT_EQ(dmx[3]["StartChannel"], 100170);
  EXPECT_EQ(dmx[3]["Enabled"], false);
  EXPECT_EQ(Stored().DMXUniverseCount(), 4);

  Result table = Run({"network", "universe", "list"});
  EXPECT_THAT(table.out, HasSubstr("100170-100339"));
}

TEST_F(NetworkCommand, UnreadableAndOutOfRangeValuesAreWarnedAboutNotFatal) {
  Write("registry.reg",
        "Windows Registry Editor Version 5.00\n\n"
        "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\TAV2]\n"
        "\"Speed\"=\"fast\"\n\n"
        "[HKEY_CURRENT_USER\\Software\\Tessavar\\Shared\\Network\\Fennick]\n"
        "\"Boards\"=dword:00000000\n");
  Result list = Run({"network", "list"});
  EXPECT_EQ(list.exitCode, 0);
  EXPECT_THAT(list.err, HasSubstr("warning: Shared\\Network\\TAV2\\Speed: Type mismatch; using "
                                  "57600"));
  EXPECT_THAT(list.err, HasSubstr("warning: Fennick boards is 0, outside 1-127"));
  json listed = List();
  EXPECT_EQ(listed["Warnings"].size(), 2u);
  EXPECT_EQ(listed["TAV"][2]["Speed"], 57600);

  // A value already out of range does not block another change; an
  // unreadable one is replaced by the value the player uses, and said so.
  Result change = Run({"network", "tav", "1", "--units", "12"});
  EXPECT_EQ(change.exitCode, 0) << change.err;
  EXPECT_THAT(change.err, HasSubstr("Type mismatch; using 57600 (now saved)"));
  EXPECT_THAT(change.err, HasSubstr("Fennick boards is 0"));
  NetworkPreferences prefs = Stored();
  EXPECT_TRUE(prefs.Problems().empty());
  EXPECT_EQ(prefs.TAVNetwork(1).UnitCount(), 12);
  EXPECT_EQ(prefs.Fennick().Boards(), 0);
}

TEST_F(NetworkCommand, EveryCommandHasHelp) {
  const std::vector<std::vector<std::string>> commands = {
      {"network"},
      {"network", "list"},
      {"network", "tav"},
      {"network", "universe"},
      {"network", "universe", "list"},
      {"network", "universe", "add"},
      {"network", "universe", "set"},
      {"network", "universe", "remove"},
      {"network", "x10"},
      {"network", "fennick"},
      {"network", "listener"},
      {"network", "output"},
      {"trigger"},
  };
  for (auto args : commands) {
    args.push_back("--help");
    Result r = Run(args);
    EXPECT_EQ(r.exitCode, 0) << args.back();
    EXPECT_THAT(r.out, HasSubstr("Usage")) << args[args.size() - 2];
  }
}

}  // namespace
}  // namespace tav::showctl::testing
