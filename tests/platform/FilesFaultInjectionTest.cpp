// The fault-injection switch: skip counts, repeat counts, short transfers, several faults.
#include <gtest/gtest.h>

#include "platform/Errors.h"
#include "platform/FaultInjection.h"

namespace FI = Platform::FaultInjection;

TEST(FaultInjection, DisarmedLetsEverythingThrough) {
  FI::Disarm();
  EXPECT_FALSE(FI::Check("WriteFile"));
  EXPECT_EQ(FI::LimitTransfer("WriteFile", 100u), 100u);
  EXPECT_EQ(FI::Hits(), 0u);
}

TEST(FaultInjection, SkipsThenFailsOnceWithTheArmedError) {
  FI::ScopedFault fault("WriteFile", ERROR_DISK_FULL, 2);
  Platform::SetLastError(0);
  EXPECT_FALSE(FI::Check("ReadFile"));  // other operations are not counted
  EXPECT_FALSE(FI::Check("WriteFile"));
  EXPECT_FALSE(FI::Check("WriteFile"));
  EXPECT_TRUE(FI::Check("WriteFile"));
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_DISK_FULL));
  EXPECT_FALSE(FI::Check("WriteFile"));
  EXPECT_EQ(FI::Hits(), 1u);
}

TEST(FaultInjection, ForeverUntilDisarmedAndSeveralAtOnce) {
  FI::Arm("ReadFile", ERROR_IO_DEVICE, 0, FI::kForever);
  FI::Arm("DeleteFile", ERROR_ACCESS_DENIED, 0, 2);
  for (int i = 0; i < 5; ++i) EXPECT_TRUE(FI::Check("ReadFile"));
  EXPECT_TRUE(FI::Check("DeleteFile"));
  EXPECT_EQ(Platform::GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  EXPECT_TRUE(FI::Check("DeleteFile"));
  EXPECT_FALSE(FI::Check("DeleteFile"));
  FI::Disarm();
  EXPECT_FALSE(FI::Check("ReadFile"));
}

TEST(FaultInjection, ShortTransfersAreSeparateFromFailures) {
  FI::ScopedFault none("Nothing", 1);
  FI::ArmShort("ReadFile", 3, 1);
  EXPECT_FALSE(FI::Check("ReadFile"));
  EXPECT_EQ(FI::LimitTransfer("ReadFile", 10u), 10u);  // skipped
  EXPECT_EQ(FI::LimitTransfer("ReadFile", 10u), 3u);
  EXPECT_EQ(FI::LimitTransfer("ReadFile", 2u), 2u);    // used up; never more than asked
  EXPECT_EQ(FI::LimitTransfer("ReadFile", 10u), 10u);
}

TEST(FaultInjection, TableIsBounded) {
  FI::Disarm();
  for (size_t i = 0; i < FI::kMaxFaults; ++i) EXPECT_TRUE(FI::Arm("X", 1));
  EXPECT_FALSE(FI::Arm("X", 1));
  FI::Disarm();
  EXPECT_TRUE(FI::Arm("X", 1));
  FI::Disarm();
}
