// UT_TIMER: duration texts and readings of the monotonic clock.
#include <gtest/gtest.h>

#include <chrono>
#include <limits>
#include <string>
#include <thread>

#include "Port_Timer.h"

namespace {

TEST(UtTimer, DurationTexts) {
    UT_TIMER timer;
    struct Case {
        double seconds;
        const char* hms;
        const char* plain;
    };
    const Case cases[] = {
        {0.0, "0:00:00.000", "0.000"},
        {1.25, "0:00:01.250", "1.250"},
        {0.29, "0:00:00.290", "0.290"},  // just below 0.29 in binary
        {59.9999, "0:00:59.999", "59.999"},
        {60.0, "0:01:00.000", "60.000"},
        {3599.9995, "0:59:59.999", "3599.999"},
        {3600.0, "1:00:00.000", "3600.000"},
        {100000.0, "27:46:40.000", "100000.000"},
        {-2.5, "0:00:00.000", "0.000"},
        {std::numeric_limits<double>::quiet_NaN(), "0:00:00.000", "0.000"},
    };
    for (const Case& c : cases) {
        EXPECT_STREQ(timer.asciitime(c.seconds, UT_TIMER::ASCII_HMS), c.hms) << c.seconds;
        EXPECT_STREQ(timer.asciitime(c.seconds, UT_TIMER::ASCII_SECONDS), c.plain) << c.seconds;
    }
    // Absurdly long durations are capped, never undefined.
    const std::string huge = timer.asciitime(1e300, UT_TIMER::ASCII_HMS);
    EXPECT_EQ(huge, timer.asciitime(std::numeric_limits<double>::infinity(), UT_TIMER::ASCII_HMS));
    EXPECT_EQ(huge.substr(huge.size() - 10), ":46:40.000");

    // The text lives in the timer until its next asciitime call.
    UT_TIMER other;
    const char* text = timer.asciitime(1.0, UT_TIMER::ASCII_HMS);
    other.asciitime(2.0, UT_TIMER::ASCII_HMS);
    EXPECT_STREQ(text, "0:00:01.000");
}

TEST(UtTimer, ReadingsAreMonotonicAndResetRestarts) {
    UT_TIMER timer;
    double previous = timer.get_delta_real();
    EXPECT_GE(previous, 0.0);
    for (int i = 0; i < 1000; ++i) {
        const double reading = timer.get_delta_real();
        EXPECT_GE(reading, previous);
        previous = reading;
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    const double beforeReset = timer.get_delta_real();
    EXPECT_GE(beforeReset, 0.05);
    timer.reset();
    const double afterReset = timer.get_delta_real();
    EXPECT_GE(afterReset, 0.0);
    EXPECT_LT(afterReset, beforeReset);
}

}  // namespace
