// UT_TIMER: a stopwatch on a monotonic clock.
#ifndef PORT_TIMER_H
#define PORT_TIMER_H

#include <cstdint>

#include "Port_Export.h"

class PORT_API UT_TIMER {
  public:
    // Text forms of asciitime.
    enum AsciiType : int {
        ASCII_HMS = 0,      // "H:MM:SS.mmm": hours without padding, minutes and seconds in two
                            // digits, milliseconds in three ("0:00:01.250", "27:46:40.000")
        ASCII_SECONDS = 1,  // seconds with three decimals ("1.250")
    };

    // Starts the timer (as reset does).
    UT_TIMER();
    // Sets the start to now.
    void reset();
    // Seconds elapsed since the last reset, on a monotonic clock; never negative.
    double get_delta_real() const;
    // The text of a duration of `seconds` (negative values are written as 0; the value is
    // rounded down to the millisecond). The text lives in this timer and stays valid until the
    // next asciitime call on it; callers copy it.
    const char* asciitime(double seconds, int type);

  private:
    std::int64_t startNanoseconds_;
    char text_[48];
};

#endif
