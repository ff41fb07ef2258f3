#include "platform/media/MpvOutputs.h"

#include "config/Settings.h"

namespace tav {

MpvOutputs MpvOutputs::FromSettings(const Settings& settings) {
  return {settings.AudioOutput(), settings.AudioDevice(), settings.VideoOutput()};
}

}  // namespace tav
