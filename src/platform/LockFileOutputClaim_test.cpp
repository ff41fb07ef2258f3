#include "platform/LockFileOutputClaim.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include "support/testing/TempFolder.h"

namespace tav {
namespace {

TEST(LockFileOutputClaim, ASecondClaimFailsNamingTheHolderUntilReleased) {
  TempFolder folder("tav-claim");
  std::string path = folder / "run/outputs.lock";
  LockFileOutputClaim first(path);
  LockFileOutputClaim second(path);
  std::string holder;
  ASSERT_TRUE(first.TryClaim("Show Player", holder));
  EXPECT_FALSE(second.TryClaim("showctl", holder));
  EXPECT_EQ(holder, "Show Player, process " + std::to_string(::getpid()));
  first.Release();
  EXPECT_TRUE(second.TryClaim("showctl", holder));
}

}  // namespace
}  // namespace tav
