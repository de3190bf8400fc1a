#pragma once
// Clock readings (CLOCK_REALTIME) and text forms of the date.

#include <ostream>
#include <string>

namespace LQ {

unsigned long getTimeNano();
// milliseconds
long getTime();

class Timer {
public:
    Timer() { reset(); }
    void reset() { start_ = getTimeNano(); }
    // milliseconds since the start; the clock can be set, so this may be negative
    long getDiff() const;
    long getDiffNano() const;

private:
    unsigned long start_;
};

std::ostream& operator<<(std::ostream& stream, const Timer& timer);

// local time of now through strftime
std::string getFormattedTime(const char* format);
std::string fullTime();
std::string fullDate();
// "%H:%M:%S." and the microseconds within the second, six digits
std::string expandedTime();
// the same for a given reading, so that the form can be tested
std::string expandedTime(long seconds, long nanoseconds);

}  // namespace LQ
