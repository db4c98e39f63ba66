// UT_TIMER: a stopwatch on std::chrono::steady_clock.
#include "Port_Timer.h"

#include <chrono>
#include <cmath>
#include <cstdio>

namespace {

std::int64_t nowNanoseconds() {
    return std::chrono::duration_cast<std::chrono::nanoseconds>(
               std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

// Whole milliseconds of a duration, rounded down. Negative and NaN durations give 0; huge
// ones are capped (at about 31 million years), so that the conversion stays defined. A
// nanosecond is added before rounding so that a value such as 0.29, stored in binary just
// below 0.29, still gives 290 ms.
long long wholeMilliseconds(double seconds) {
    if (!(seconds > 0.0)) {
        return 0;
    }
    constexpr double kMaxMilliseconds = 1e15;
    const double milliseconds = seconds * 1000.0 + 1e-6;
    if (milliseconds >= kMaxMilliseconds) {
        return static_cast<long long>(kMaxMilliseconds);
    }
    return static_cast<long long>(std::floor(milliseconds));
}

}  // namespace

UT_TIMER::UT_TIMER() : startNanoseconds_(nowNanoseconds()), text_{} {}

void UT_TIMER::reset() {
    startNanoseconds_ = nowNanoseconds();
}

double UT_TIMER::get_delta_real() const {
    const std::int64_t elapsed = nowNanoseconds() - startNanoseconds_;
    return elapsed > 0 ? static_cast<double>(elapsed) / 1e9 : 0.0;
}

const char* UT_TIMER::asciitime(double seconds, int type) {
    const long long total = wholeMilliseconds(seconds);
    const int millis = static_cast<int>(total % 1000);
    const long long wholeSeconds = total / 1000;
    if (type == ASCII_SECONDS) {
        std::snprintf(text_, sizeof text_, "%lld.%03d", wholeSeconds, millis);
    } else {
        // ASCII_HMS, also for codes this timer does not know.
        const long long hours = wholeSeconds / 3600;
        const int minutes = static_cast<int>((wholeSeconds / 60) % 60);
        const int secs = static_cast<int>(wholeSeconds % 60);
        std::snprintf(text_, sizeof text_, "%lld:%02d:%02d.%03d", hours, minutes, secs, millis);
    }
    return text_;
}
