#pragma once
// Checks, levelled logging and text conversions shared by the whole library.
//
// A broken precondition is a programming error: the check writes its full text to
// the log at error priority and throws the const char* "assertion". Only the frame
// driver catches it.

#include <sstream>
#include <string>

namespace LQ_LOGGER_FORMAT {
// text padded on the right with blanks to width, or cut to width
std::string alignString(const std::string& text, int width);
// value right-aligned in width with fill; width below 1 gives just the number
std::string toStr(int value, int width, char fill);
}  // namespace LQ_LOGGER_FORMAT

namespace LQ {

typedef unsigned char uchar;
typedef signed char schar;
typedef unsigned int uint;

enum LogLevel { LOG_LEVEL_DEBUG = 0, LOG_LEVEL_INFO = 1, LOG_LEVEL_WARNING = 2, LOG_LEVEL_FATAL = 4 };

constexpr const char* LOG_TAG = "LumiqVision";

// the one process-wide level; messages below it are dropped
int& getLogLevel();

std::string alignString(const std::string& text, int width);

// Sends text to the log line by line, each line in pieces of at most 1023 characters.
void writeLog(int priority, const std::string& text);

// The levelled line: tag, file, line, function, message.
std::string formatLogLine(int level, const char* file, int line, const char* function, const std::string& message);
// Writes a levelled line if the level passes, or always when force is set.
void logMessage(int level, const char* file, int line, const char* function, const std::string& message,
                bool force = false);
inline bool logLevelPasses(int level) { return getLogLevel() <= level; }

// Builds the full text of a failed check.
std::string assertionText(const char* expression, const char* file, int line, const char* function,
                          const std::string& tail);
// Logs the failed check and throws the const char* "assertion".
[[noreturn]] void failAssertion(const char* expression, const char* file, int line, const char* function,
                                const std::string& tail);

// ---- text conversions -------------------------------------------------------

template <class T>
T fromStr(const std::string& text);

template <class T>
std::string toStr(const T& value);

// value in decimal, padded on the left with '0' to width
std::string toStr(unsigned long value, int width);

// Enumerations with printed names specialise this with
//   static const char* typeName();  static const char* const* names();  static int count();
// and get toStr, operator>> (through readEnum) and enumValues.
template <class T>
struct EnumNames;

template <class T>
std::string enumValues();

// Reads one token up to a tab, line end, blank, ')' or ',' (left in the stream) and
// matches it against the enumeration's names.
template <class T>
std::istream& readEnum(std::istream& stream, T& value);

template <class T>
const char* enumName(T value);

// The letter value types append to their printed names.
template <class T>
char typeChar();
template <>
inline char typeChar<signed char>() { return 'C'; }
template <>
inline char typeChar<short>() { return 'S'; }
template <>
inline char typeChar<int>() { return 'I'; }
template <>
inline char typeChar<unsigned int>() { return 'U'; }
template <>
inline char typeChar<float>() { return 'F'; }
template <>
inline char typeChar<double>() { return 'D'; }

}  // namespace LQ

// ---- logging macros ---------------------------------------------------------

#define LQ_LOG_AT(level, message)                                                             \
    do {                                                                                      \
        if (::LQ::logLevelPasses(level)) {                                                    \
            std::ostringstream lq_log_stream_;                                                \
            lq_log_stream_ << message;                                                        \
            ::LQ::logMessage(level, __FILE__, __LINE__, __func__, lq_log_stream_.str());      \
        }                                                                                     \
    } while (0)

// Written whatever the log level.
#define LQ_LOG_FORCED(level, message)                                                         \
    do {                                                                                      \
        std::ostringstream lq_log_stream_;                                                    \
        lq_log_stream_ << message;                                                            \
        ::LQ::logMessage(level, __FILE__, __LINE__, __func__, lq_log_stream_.str(), true);    \
    } while (0)

#define LQ_LOGD(message) LQ_LOG_AT(::LQ::LOG_LEVEL_DEBUG, message)
#define LQ_LOGI(message) LQ_LOG_AT(::LQ::LOG_LEVEL_INFO, message)
#define LQ_LOGW(message) LQ_LOG_AT(::LQ::LOG_LEVEL_WARNING, message)
#define LQ_LOGF(message) LQ_LOG_AT(::LQ::LOG_LEVEL_FATAL, message)

// ---- check macros -----------------------------------------------------------
// The expression text is the source text; the tail explains the values.

#define LQ_ASSERT_MSG(condition, message)                                                     \
    do {                                                                                      \
        if (!(condition)) {                                                                   \
            std::ostringstream lq_check_stream_;                                              \
            lq_check_stream_ << message;                                                      \
            ::LQ::failAssertion(#condition, __FILE__, __LINE__, __func__, lq_check_stream_.str()); \
        }                                                                                     \
    } while (0)

#define LQ_ASSERT(condition) LQ_ASSERT_MSG(condition, "")

// Unconditional failure, expression "0".
#define LQ_FAIL(message) LQ_ASSERT_MSG(0, message)

#define LQ_ASSERT_BINARY_(a, b, op, opposite)                                                 \
    do {                                                                                      \
        const auto& lq_check_a_ = (a);                                                        \
        const auto& lq_check_b_ = (b);                                                        \
        /* a size against a literal: the mixed signedness is meant */                         \
        _Pragma("GCC diagnostic push") _Pragma("GCC diagnostic ignored \"-Wsign-compare\"")   \
        const bool lq_check_ok_ = lq_check_a_ op lq_check_b_;                                 \
        _Pragma("GCC diagnostic pop") if (!lq_check_ok_) {                                    \
            std::ostringstream lq_check_stream_;                                              \
            lq_check_stream_ << lq_check_a_ << opposite << lq_check_b_;                       \
            ::LQ::failAssertion("(" #a ") " #op " (" #b ")", __FILE__, __LINE__, __func__,    \
                                lq_check_stream_.str());                                      \
        }                                                                                     \
    } while (0)

#define LQ_ASSERT_EQ(a, b) LQ_ASSERT_BINARY_(a, b, ==, " != ")
#define LQ_ASSERT_NE(a, b) LQ_ASSERT_BINARY_(a, b, !=, " == ")
#define LQ_ASSERT_LT(a, b) LQ_ASSERT_BINARY_(a, b, <, " >= ")
#define LQ_ASSERT_LE(a, b) LQ_ASSERT_BINARY_(a, b, <=, " > ")
#define LQ_ASSERT_GT(a, b) LQ_ASSERT_BINARY_(a, b, >, " <= ")
#define LQ_ASSERT_GE(a, b) LQ_ASSERT_BINARY_(a, b, >=, " < ")

#define LQ_ASSERT_NOT_NULL(p)                                                                 \
    do {                                                                                      \
        if (!(p)) ::LQ::failAssertion("(" #p ")", __FILE__, __LINE__, __func__, " == NULL");  \
    } while (0)

#include "LQ_Utils.inl"
#include "LQ_StringUtils.h"
