#include "show/ShowPlayer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "show/testing/ShowRig.h"

namespace tav {
namespace {

TEST(ShowPlayerSmoke, Builds) {
  ShowRig rig;
  rig.Start();
}

}  // namespace
}  // namespace tav
