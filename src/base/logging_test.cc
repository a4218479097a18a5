#include "base/logging.h"

#include <memory>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace base {
namespace {

TEST(LoggingTest, LinesCarrySeverityUnitAndText) {
  ScopedLogCapture capture;
  LOG(INFO) << "answer " << 42;
  LOG(WARNING) << "careful";
  LOG(ERROR) << "bad " << 1.5;
  const auto lines = capture.lines();
  ASSERT_EQ(lines.size(), 3u);
  EXPECT_EQ(lines[0].severity, LogSeverity::kInfo);
  EXPECT_EQ(lines[0].message, "answer 42");
  // The unit is named below the source root, whatever the build directory.
  EXPECT_EQ(lines[0].file, "base/logging_test.cc");
  EXPECT_GT(lines[0].line, 0);
  EXPECT_EQ(lines[1].severity, LogSeverity::kWarning);
  EXPECT_EQ(lines[2].severity, LogSeverity::kError);
  EXPECT_EQ(lines[2].message, "bad 1.5");
}

TEST(LoggingTest, VerboseLinesFollowTheLevel) {
  ScopedLogCapture capture;
  int evaluated = 0;
  VLOG(1) << "hidden " << ++evaluated;
  EXPECT_TRUE(capture.lines().empty());
  EXPECT_EQ(evaluated, 0);  // Arguments are not evaluated when off.
  SetVlogLevel(1);
  VLOG(1) << "shown";
  VLOG(2) << "still hidden";
  SetVlogLevel(0);
  ASSERT_EQ(capture.lines().size(), 1u);
  EXPECT_EQ(capture.lines()[0].severity, LogSeverity::kVerbose);
  EXPECT_EQ(capture.lines()[0].message, "shown");
}

TEST(LoggingTest, CapturesNestAndRestore) {
  ScopedLogCapture outer;
  {
    ScopedLogCapture inner;
    LOG(INFO) << "inner";
    EXPECT_TRUE(inner.Contains(LogSeverity::kInfo, "inner"));
  }
  LOG(INFO) << "outer";
  ASSERT_EQ(outer.lines().size(), 1u);
  EXPECT_EQ(outer.lines()[0].message, "outer");
}

TEST(LoggingTest, PassingChecksLogNothing) {
  ScopedLogCapture capture;
  int x = 3;
  CHECK(x == 3);
  CHECK(&x) << "never evaluated";
  int* p = CHECK_NOTNULL(&x);
  EXPECT_EQ(p, &x);
  auto owned = CHECK_NOTNULL(std::make_unique<int>(7));
  EXPECT_EQ(*owned, 7);
  EXPECT_TRUE(capture.lines().empty());
}

TEST(LoggingDeathTest, CheckLogsTheConditionAsWritten) {
  int size = 0;
  EXPECT_DEATH(CHECK(size > 0), "base/logging_test.cc:[0-9]+\\] Check failed: size > 0");
  EXPECT_DEATH(CHECK(size > 0) << "extra " << 7, "Check failed: size > 0 extra 7");
}

TEST(LoggingDeathTest, FatalReachesTheAndroidLogEvenWhenCaptured) {
  EXPECT_DEATH(
      {
        ScopedLogCapture capture;
        LOG(FATAL) << "input of size " << 7 << " is not divisible by " << 2;
      },
      "input of size 7 is not divisible by 2");
}

TEST(LoggingDeathTest, NotNullChecksNameTheArgument) {
  int* dsss_encoder = nullptr;
  EXPECT_DEATH(CHECK_NOTNULL(dsss_encoder), "Check failed: 'dsss_encoder' Must be non-null");
  EXPECT_DEATH(CHECK_ALLOCATED(static_cast<int*>(nullptr)),
               "Check failed: static_cast<int\\*>\\(nullptr\\)");
}

}  // namespace
}  // namespace base
