// Tray commands: showctl speaks to a running player as the tray program
// does, over the tray link. `monitor` and `status` introduce showctl as the
// tray (the player then sends its status, log lines and sequence notices to
// it and no longer to a tray that introduced itself before); the other
// commands send one request and leave.

#include <fmt/core.h>

#include <cstdio>
#include <memory>
#include <optional>
#include <string>

#include "ArgumentValues.h"
#include "CommandRegistry.h"
#include "host/Msg.h"
#include "platform/UnixTrayLink.h"
#include "platform/UnixTrayLinkClient.h"
#include "schedule/MonitoredShowEvent.h"
#include "schedule/ScheduleLookup.h"
#include "support/Error.h"
#include "support/Serialize.h"

namespace tav::showctl {
namespace {

constexpr int kStatusTimeoutMs = 5000;

std::unique_ptr<UnixTrayLinkClient> ConnectToPlayer() {
  std::string path = UnixTrayLink::DefaultSocketPath();
  try {
    return std::make_unique<UnixTrayLinkClient>(path);
  } catch (const Error& e) {
    throw CommandFailed(e.Description());
  }
}

void SendRequest(int32_t type, const std::string& body = "") {
  auto client = ConnectToPlayer();
  try {
    client->Send(CopyDataFrame(0, TypedMessageText(type, body)));
  } catch (const Error& e) {
    throw CommandFailed(e.Description());
  }
}

std::string ScheduleTypeName(int32_t type) {
  switch (type) {
    case kScheduleTypeNone:
      return "no schedule";
    case kScheduleTypeWeek:
      return "week schedule";
    case kScheduleTypeYear:
      return "year schedule";
    case kScheduleTypeOnDemand:
      return "on demand";
    default:
      return fmt::format("schedule type {}", type);
  }
}

std::string RangeText(const TimeRange& range) {
  if (range.HasStart() && range.HasEnd()) {
    return range.StartTime().ToText() + " to " + range.EndTime().ToText();
  }
  if (range.HasStart()) return "from " + range.StartTime().ToText();
  if (range.HasEnd()) return "until " + range.EndTime().ToText();
  return "at any time";
}

// "Xmas.tss, 2024-12-24 18:00:00 to 2024-12-24 22:00:00, week schedule".
std::string ShowEventText(const std::string& serialized) {
  if (serialized.empty()) return "(none)";
  MonitoredShowEvent event;
  try {
    event.Deserialize(serialized);
  } catch (const Error& e) {
    return serialized + " (unreadable: " + e.Description() + ")";
  }
  if (event.Filename().empty()) return "(no show)";
  std::string text = event.Filename() + ", " + RangeText(*event.Range()) + ", " +
                     ScheduleTypeName(event.ScheduleType());
  if (event.ShuttingDown()) text += ", shutting down";
  return text;
}

// "Carol.tsq (section 4) at 2024-12-24 18:00:05".
std::string SequenceNoticeDescription(const std::string& body) {
  try {
    TextArray fields = ListFromText(body, 0);
    if (ArrayCount(fields) == 3) {
      return fmt::format("{} (section {}) at {}", UnescapeText(fields[0]), LongFromText(fields[1]),
                         fields[2]);
    }
  } catch (const Error&) {
  }
  return body;
}

void Print(const char* label, const std::string& text) {
  fmt::print("{:<8} {}\n", label, text);
  std::fflush(stdout);
}

void PrintMessage(const TAVMessage& message) {
  const std::string& body = message.Text();
  switch (message.MessageType()) {
    case kMsgLogText: {
      size_t start = 0;
      for (;;) {
        size_t end = body.find("\r\n", start);
        Print("log", body.substr(start, end - start));
        if (end == std::string::npos) break;
        start = end + 2;
      }
      break;
    }
    case kMsgCurrentShow:
      Print("current", ShowEventText(body));
      break;
    case kMsgNextShow:
      Print("next", ShowEventText(body));
      break;
    case kMsgPlayerReady:
      Print("ready", "the show player is initialised");
      break;
    case kMsgSequenceStart:
      Print("start", SequenceNoticeDescription(body));
      break;
    case kMsgSequenceStop:
      Print("stop", SequenceNoticeDescription(body));
      break;
    default:
      Print("message", fmt::format("type {}: {}", message.MessageType(), body));
      break;
  }
}

// Introduces showctl as the tray; the player answers with its status.
std::unique_ptr<UnixTrayLinkClient> IntroduceAsTray() {
  auto client = ConnectToPlayer();
  try {
    client->Send(CopyDataFrame(0, TypedMessageText(kMsgTrayIntroduction, "")));
  } catch (const Error& e) {
    throw CommandFailed(e.Description());
  }
  return client;
}

void Monitor() {
  auto client = IntroduceAsTray();
  for (;;) {
    std::optional<TrayFrame> frame;
    try {
      frame = client->Receive(-1);
    } catch (const Error& e) {
      if (client->Closed()) {
        Print("closed", "the show player has closed the connection");
        return;
      }
      throw CommandFailed(e.Description());
    }
    try {
      PrintMessage(DecodeReceivedMessage(*frame));
    } catch (const Error&) {
      Print("invalid", "a message without its terminating zero byte");
    }
  }
}

void Status() {
  auto client = IntroduceAsTray();
  std::optional<std::string> next;
  // The player sends the next show, then the current one; log lines and the
  // ready notice may come first.
  for (;;) {
    std::optional<TrayFrame> frame;
    try {
      frame = client->Receive(kStatusTimeoutMs);
    } catch (const Error& e) {
      throw CommandFailed(e.Description());
    }
    if (!frame) throw CommandFailed("The show player did not send its status in time");
    TAVMessage message;
    try {
      message = DecodeReceivedMessage(*frame);
    } catch (const Error&) {
      continue;
    }
    if (message.MessageType() == kMsgNextShow) next = message.Text();
    if (message.MessageType() == kMsgCurrentShow) {
      Print("current", ShowEventText(message.Text()));
      Print("next", ShowEventText(next.value_or("")));
      return;
    }
  }
}

DateTime ParseWhen(const std::string& option, const std::string& text) {
  std::optional<DateTime> when = DateTime::FromText(text);
  // A time alone would fall on the platform's day 0, in 1899.
  if (!when || when->Serial() < 1.0) {
    throw CommandFailed(
        fmt::format("{}: \"{}\" is not a date and time (yyyy-mm-dd hh:mm:ss)", option, text));
  }
  return *when;
}

struct OnDemandOptions {
  std::string file;
  std::string from;
  std::string until;
  bool clear = false;
};

std::string OnDemandRequest(const OnDemandOptions& o) {
  auto event = std::make_shared<MonitoredShowEvent>();
  if (o.clear) {
    if (!o.file.empty() || !o.from.empty() || !o.until.empty()) {
      throw CommandFailed("ondemand --clear takes no show file and no times");
    }
    return event->Serialize();
  }
  if (o.file.empty()) throw CommandFailed("ondemand needs a show file, or --clear");
  event->SetFilename(o.file);
  event->SetScheduleType(kScheduleTypeOnDemand);
  std::optional<DateTime> from, until;
  if (!o.from.empty()) from = ParseWhen("--from", o.from);
  if (!o.until.empty()) until = ParseWhen("--until", o.until);
  if (from && until && *until <= *from) throw CommandFailed("--until must be later than --from");
  if (from) event->Range()->SetStartTime(*from);
  if (until) event->Range()->SetEndTime(*until);
  return event->Serialize();
}

// Network, unit and input: whole numbers of 0 or more.
struct TriggerOptions {
  std::string network, unit, input;
};

int32_t InputPart(const char* what, const std::string& text) {
  int32_t value = ParseLong(text, what);
  if (value < 0) throw CommandFailed(fmt::format("{}: {} is below 0", what, value));
  return value;
}

std::string TriggerRequest(const TriggerOptions& o) {
  return SimulatedInputText(
      {InputPart("NETWORK", o.network), InputPart("UNIT", o.unit), InputPart("INPUT", o.input)});
}

const char* kNotRunningNote =
    "Talks to the player at $TAV_TRAY_SOCKET, else "
    "$XDG_RUNTIME_DIR/tessavar/showplayer.sock, else /tmp/tessavar-<uid>/showplayer.sock.";

CommandGroup reg{
    "tray", [](CLI::App& app) {
      auto* monitor = app.add_subcommand(
          "monitor",
          "Follow the running player as its tray: log lines, show status and sequence starts and "
          "stops as they happen (until the player ends or Ctrl-C)");
      monitor->footer(kNotRunningNote);
      monitor->callback([] { Monitor(); });

      auto* status = app.add_subcommand(
          "status",
          "Print the running player's current and next show once (introduces showctl as "
          "the tray, so a running monitor stops receiving)");
      status->footer(kNotRunningNote);
      status->callback([] { Status(); });

      auto options = std::make_shared<OnDemandOptions>();
      auto* ondemand = app.add_subcommand(
          "ondemand",
          "Ask the running player to play a show on demand, or clear the show on demand");
      ondemand->add_option("FILE", options->file, "The show file");
      ondemand->add_option("--from", options->from,
                           "Start, \"yyyy-mm-dd hh:mm:ss\" (default: none, it plays at once)");
      ondemand->add_option("--until", options->until,
                           "End, \"yyyy-mm-dd hh:mm:ss\" (default: open-ended)");
      ondemand->add_flag("--clear", options->clear, "Clear the show on demand");
      ondemand->footer(kNotRunningNote);
      ondemand->callback([options] {
        std::string request = OnDemandRequest(*options);
        SendRequest(kMsgShowOnDemand, request);
      });

      auto* reload = app.add_subcommand("reload", "Make the running player reload its schedules");
      reload->footer(kNotRunningNote);
      reload->callback([] { SendRequest(kMsgReloadSchedules); });

      auto* schedulesOn = app.add_subcommand(
          "schedules-on",
          "Make a player started for on-demand shows only follow its schedules again");
      schedulesOn->footer(kNotRunningNote);
      schedulesOn->callback([] { SendRequest(kMsgLeaveOnDemandOnly); });

      auto* shutdown = app.add_subcommand(
          "shutdown",
          "Shut the running player down once its current show has played its shutdown section");
      auto now = std::make_shared<bool>(false);
      shutdown->add_flag("--now", *now, "Shut down at once, without letting the show finish");
      shutdown->footer(kNotRunningNote);
      shutdown->callback(
          [now] { SendRequest(*now ? kMsgImmediateShutdown : kMsgGracefulShutdown); });

      auto input = std::make_shared<TriggerOptions>();
      auto* trigger = app.add_subcommand(
          "trigger",
          "Fire an input of the running player as if the hardware had raised it, to try "
          "interactive shows and startup triggers without the hardware");
      trigger
          ->add_option("NETWORK", input->network,
                       "The network the input is on, as the show's trigger names it")
          ->required();
      trigger->add_option("UNIT", input->unit, "The unit (controller) id")->required();
      trigger->add_option("INPUT", input->input, "The input (circuit) number on that unit")
          ->required();
      trigger->footer(kNotRunningNote);
      trigger->callback([input] { SendRequest(kMsgSimulateInput, TriggerRequest(*input)); });
    }};

}  // namespace
}  // namespace tav::showctl
