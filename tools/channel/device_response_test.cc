#include "tools/channel/device_response.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"
#include "tools/channel/channel_test_util.h"

namespace vesk_channel {
namespace {

constexpr DeviceRole kSpeaker = DeviceRole::kSpeaker;
constexpr DeviceRole kMicrophone = DeviceRole::kMicrophone;
constexpr DeviceProfile kBudget = DeviceProfile::kBudgetPhone;
constexpr DeviceProfile kFlagship = DeviceProfile::kFlagshipPhone;

TEST(DeviceResponseTest, CurvesPassTheirAnchorsAndTheHighPass) {
  EXPECT_DOUBLE_EQ(DeviceGainDb(kSpeaker, kBudget, 17000), -6);
  EXPECT_DOUBLE_EQ(DeviceGainDb(kSpeaker, kBudget, 19000), -15);
  EXPECT_DOUBLE_EQ(DeviceGainDb(kSpeaker, kBudget, 20000), -30);
  EXPECT_DOUBLE_EQ(DeviceGainDb(kSpeaker, kFlagship, 20000), -9);
  EXPECT_DOUBLE_EQ(DeviceGainDb(kSpeaker, DeviceProfile::kFlat, 20000), 0);
  // Microphones: the curve plus a second-order Butterworth high-pass,
  // |H|^2 = r^4 / (1 + r^4) with r = f / 100 Hz.
  EXPECT_NEAR(DeviceGainDb(kMicrophone, kBudget, 19000), -9, 1e-5);
  EXPECT_NEAR(DeviceGainDb(kMicrophone, kFlagship, 100), -3.0103, 1e-4);
  EXPECT_NEAR(DeviceGainDb(kMicrophone, kBudget, 50), 10 * std::log10(1.0 / 17), 1e-9);
  EXPECT_DOUBLE_EQ(DeviceGainDb(kSpeaker, kBudget, 10), -30);  // Held below the first anchor.
}

TEST(DeviceResponseTest, RollOffIsSmoothAndNeverOvershootsItsAnchors) {
  for (DeviceProfile profile : {kBudget, kFlagship}) {
    for (DeviceRole role : {kSpeaker, kMicrophone}) {
      double previous = DeviceGainDb(role, profile, 14000);
      for (double hz = 14010; hz <= 24000; hz += 10) {
        const double db = DeviceGainDb(role, profile, hz);
        ASSERT_LE(db, previous + 1e-6) << hz;  // Falls all the way up.
        ASSERT_LT(previous - db, 0.2) << hz;   // No step.
        previous = db;
      }
    }
  }
  // Between 16 and 17 kHz the budget speaker stays between its anchors.
  for (double hz = 16000; hz <= 17000; hz += 50) {
    const double db = DeviceGainDb(kSpeaker, kBudget, hz);
    EXPECT_LE(db, -4.5);
    EXPECT_GE(db, -6);
  }
}

TEST(DeviceResponseTest, FilteredTonesHaveTheCurvesGainAndKeepTheirPhase) {
  for (int rate : {44100, 48000}) {
    for (DeviceRole role : {kSpeaker, kMicrophone}) {
      for (double hz : {250.0, 1000.0, 3000.0, 15500.0, 17000.0, 18500.0, 19000.0, 20000.0}) {
        if (hz >= 0.45 * rate) continue;
        const std::vector<float> x = Tone(hz, rate, 1.0, 1000.0);
        const std::vector<float> y = ApplyDeviceResponse(role, kBudget, rate, x);
        ASSERT_EQ(y.size(), x.size());
        const size_t begin = rate / 4, end = x.size() - rate / 4;
        const std::complex<double> in = Phasor(x, begin, end, hz, rate);
        const std::complex<double> out = Phasor(y, begin, end, hz, rate);
        SCOPED_TRACE(::testing::Message() << rate << " Hz, " << hz << " Hz");
        EXPECT_NEAR(ToDb(std::abs(out) / std::abs(in)), DeviceGainDb(role, kBudget, hz), 0.2);
        // The loudspeaker's filter has zero phase (the microphone's
        // high-pass turns the phase by 1.4 x 100 Hz / f rad).
        if (role == kSpeaker) {
          EXPECT_NEAR(std::arg(out / in), 0.0, 0.01);
        }
      }
    }
  }
}

TEST(DeviceResponseTest, FlatIsTheIdentityAndNamesRoundTrip) {
  const std::vector<float> x = Tone(440, 44100, 0.1);
  EXPECT_EQ(ApplyDeviceResponse(kMicrophone, DeviceProfile::kFlat, 44100, x), x);
  for (DeviceProfile p : {DeviceProfile::kFlat, kBudget, kFlagship}) {
    DeviceProfile parsed;
    ASSERT_TRUE(ParseDeviceProfile(DeviceProfileName(p), &parsed));
    EXPECT_EQ(parsed, p);
  }
  DeviceProfile unused;
  EXPECT_FALSE(ParseDeviceProfile("cheap", &unused));
}

}  // namespace
}  // namespace vesk_channel
