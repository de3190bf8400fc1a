#include "LQ_Time.h"

#include <time.h>

#include "LQ_Utils.h"

namespace LQ {

unsigned long getTimeNano() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return static_cast<unsigned long>(now.tv_sec) * 1000000000ul + static_cast<unsigned long>(now.tv_nsec);
}

long getTime() { return static_cast<long>(getTimeNano() / 1000000ul); }

long Timer::getDiffNano() const { return static_cast<long>(getTimeNano() - start_); }

long Timer::getDiff() const { return getDiffNano() / 1000000; }

std::ostream& operator<<(std::ostream& stream, const Timer& timer) { return stream << timer.getDiff() << "ms"; }

namespace {
std::string formatLocal(time_t seconds, const char* format) {
    tm local{};
    localtime_r(&seconds, &local);
    char buffer[80];
    const size_t length = strftime(buffer, sizeof(buffer), format, &local);
    return std::string(buffer, length);
}
}  // namespace

std::string getFormattedTime(const char* format) { return formatLocal(time(nullptr), format); }

std::string fullTime() { return getFormattedTime("%Y_%m_%d__%H_%M_%S"); }

std::string fullDate() { return getFormattedTime("%Y_%m_%d"); }

std::string expandedTime(long seconds, long nanoseconds) {
    return formatLocal(static_cast<time_t>(seconds), "%H:%M:%S.") +
           LQ_LOGGER_FORMAT::toStr(static_cast<int>(nanoseconds / 1000), 6, '0');
}

std::string expandedTime() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return expandedTime(now.tv_sec, now.tv_nsec);
}

}  // namespace LQ
