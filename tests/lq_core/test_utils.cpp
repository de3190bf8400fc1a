#include <gtest/gtest.h>

#include <cstring>
#include <sstream>
#include <string>

#include "LQ_ColorMode.h"
#include "LQ_Utils.h"
#include "LogCapture.h"

using namespace LQ;

namespace {
const char* const BACKTRACE_TEXT = "*** BACKTRACE: ***\nBacktrace is implemented only for linux";

std::string fileBaseName(const char* path) {
    const char* slash = std::strrchr(path, '/');
    return slash ? slash + 1 : path;
}
}  // namespace

TEST(Checks, failedCheckWritesTwoErrorsAndThrowsPlainPointer) {
    LogCapture capture;
    const int a = 1, b = 2;
    int line = 0;
    bool caughtPointer = false;
    try {
        line = __LINE__ + 1;
        LQ_ASSERT_EQ(a, b);
    } catch (const std::exception&) {
        ADD_FAILURE() << "a check must not throw a std::exception";
    } catch (const char* what) {
        caughtPointer = std::strcmp(what, "assertion") == 0;
    }
    EXPECT_TRUE(caughtPointer);
    ASSERT_EQ(capture.entries().size(), 2u);
    const std::string expected = std::string("Assertion `(a) == (b)` failed in ") + __FILE__ + " line " +
                                 std::to_string(line) + ", function TestBody:    \n1 != 2\n";
    EXPECT_EQ(capture.entries()[0].text, expected);
    EXPECT_EQ(capture.entries()[1].text, BACKTRACE_TEXT);
    for (const LogEntry& entry : capture.entries()) {
        EXPECT_EQ(entry.priority, 6);
        EXPECT_EQ(entry.tag, "LumiqVision");
    }
}

TEST(Checks, everyFormHasItsExpressionAndTail) {
    const int small = 3, big = 7;
    const int* nothing = nullptr;
    struct Case {
        std::function<void()> body;
        const char *expression, *tail;
    };
    const Case cases[] = {
        {[&] { LQ_ASSERT(small > big); }, "small > big", ""},
        {[&] { LQ_ASSERT_MSG(small > big, "small is " << small); }, "small > big", "small is 3"},
        {[&] { LQ_ASSERT_EQ(small, big); }, "(small) == (big)", "3 != 7"},
        {[&] { LQ_ASSERT_NE(small, small); }, "(small) != (small)", "3 == 3"},
        {[&] { LQ_ASSERT_LT(big, small); }, "(big) < (small)", "7 >= 3"},
        {[&] { LQ_ASSERT_GT(small, big); }, "(small) > (big)", "3 <= 7"},
        {[&] { LQ_ASSERT_NOT_NULL(nothing); }, "(nothing)", " == NULL"},
        {[&] { LQ_FAIL("gave up after " << big); }, "0", "gave up after 7"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.expression);
        const FailedCheck check = catchCheck(c.body);
        EXPECT_TRUE(check.thrown);
        EXPECT_EQ(check.expression, c.expression);
        EXPECT_EQ(check.tail, c.tail);
        EXPECT_EQ(check.file, __FILE__);
        EXPECT_EQ(check.function, "operator()");
    }

    // Boundaries pass: equality satisfies LE and GE, a non-null pointer passes.
    EXPECT_NO_THROW({
        LQ_ASSERT_LE(small, small);
        LQ_ASSERT_GE(big, big);
        LQ_ASSERT_NOT_NULL(&small);
        LQ_ASSERT_MSG(small < big, "unused");
    });
}

TEST(Logging, lineFormatAndAlignment) {
    EXPECT_EQ(LQ_LOGGER_FORMAT::alignString("twelve chars", 15), "twelve chars   ");
    EXPECT_EQ(LQ_LOGGER_FORMAT::alignString("sixsix", 3), "six");
    EXPECT_EQ(LQ::alignString("ab", 4), "ab  ");
    EXPECT_EQ(LQ_LOGGER_FORMAT::toStr(7, 4, ' '), "   7");
    EXPECT_EQ(LQ_LOGGER_FORMAT::toStr(12345, 4, ' '), "12345");

    // tag, file after its last '/' padded to 30, line in 4, function padded to 15
    EXPECT_EQ(
        formatLogLine(LOG_LEVEL_WARNING, "/src/lq/LQ_Image.cpp", 7, "create", "no memory"),
        "WARNING LQ_Image.cpp" + std::string(18, ' ') + "   7 create" + std::string(9, ' ') + " no memory\n");
    // over-long names are cut so the columns stay put
    const std::string longFile(40, 'f');
    const std::string longFunction(20, 'g');
    EXPECT_EQ(formatLogLine(LOG_LEVEL_FATAL, longFile.c_str(), 1234, longFunction.c_str(), "m"),
              "FATAL   " + std::string(30, 'f') + "1234 " + std::string(15, 'g') + " m\n");
}

TEST(Logging, defaultLevelFiltersAndPriorities) {
    ASSERT_EQ(getLogLevel(), 2);
    LogCapture capture;
    LQ_LOGD("debug " << 1);
    LQ_LOGI("info " << 2);
    EXPECT_TRUE(capture.entries().empty());

    const int warningLine = __LINE__ + 1;
    LQ_LOGW("warning " << 3);
    LQ_LOGF("fatal " << 4);
    ASSERT_EQ(capture.entries().size(), 2u);
    // the line's own newline ends it; the sink receives the text without it
    EXPECT_EQ(capture.entries()[0].text,
              "WARNING " + LQ_LOGGER_FORMAT::alignString(fileBaseName(__FILE__), 30) +
                  LQ_LOGGER_FORMAT::toStr(warningLine, 4, ' ') + " TestBody        warning 3");
    EXPECT_EQ(capture.entries()[0].priority, 4);
    EXPECT_EQ(capture.entries()[1].priority, 6);

    // a lower level lets the quieter messages through
    capture.clear();
    getLogLevel() = LOG_LEVEL_DEBUG;
    LQ_LOGD("now visible");
    getLogLevel() = LOG_LEVEL_WARNING;
    ASSERT_EQ(capture.entries().size(), 1u);
    EXPECT_EQ(capture.entries()[0].text.substr(0, 8), "DEBUG   ");
    EXPECT_EQ(capture.entries()[0].priority, 4);
}

TEST(Logging, longLinesGoInPiecesAndEmptyLinesNowhere) {
    LogCapture capture;
    std::string line(2500, ' ');
    for (size_t i = 0; i < line.size(); ++i) line[i] = static_cast<char>('a' + i % 26);
    writeLog(4, line);
    ASSERT_EQ(capture.entries().size(), 3u);
    EXPECT_EQ(capture.entries()[0].text.size(), 1023u);
    EXPECT_EQ(capture.entries()[2].text.size(), 454u);
    EXPECT_EQ(capture.entries()[0].text + capture.entries()[1].text + capture.entries()[2].text, line);

    capture.clear();
    writeLog(6, std::string(1023, 'x') + "\n\n" + std::string(1024, 'y') + "\n");
    ASSERT_EQ(capture.entries().size(), 3u);
    EXPECT_EQ(capture.entries()[0].text, std::string(1023, 'x'));
    EXPECT_EQ(capture.entries()[1].text, std::string(1023, 'y'));
    EXPECT_EQ(capture.entries()[2].text, "y");
    for (const LogEntry& entry : capture.entries()) EXPECT_EQ(entry.priority, 6);

    capture.clear();
    writeLog(4, "\n\n");
    writeLog(4, "");
    EXPECT_TRUE(capture.entries().empty());
}

// fromStr reads only what parses; toStr pads with zeros but never cuts
TEST(Conversions, fromStrAndToStr) {
    EXPECT_EQ(fromStr<int>("12x"), 12);
    EXPECT_EQ(fromStr<int>(" -3"), -3);
    EXPECT_EQ(fromStr<float>("2.5"), 2.5f);
    const FailedCheck check = catchCheck([] { fromStr<int>("abc"); });
    EXPECT_EQ(check.expression, "(ss.fail()) != (true)");
    EXPECT_EQ(check.tail, "1 == 1");
    EXPECT_EQ(check.function, "fromStr");
    EXPECT_TRUE(catchCheck([] { fromStr<float>(""); }).thrown);

    EXPECT_EQ(toStr(true), "1");
    EXPECT_EQ(toStr(-15), "-15");
    EXPECT_EQ(toStr(4000000000u), "4000000000");
    EXPECT_EQ(toStr(42ul, 6), "000042");
    EXPECT_EQ(toStr(1234567ul, 3), "1234567");
}

TEST(Conversions, enumNamesReadAndWrite) {
    EXPECT_EQ(toStr(COLOR_MODE_BGR), "COLOR_MODE_BGR");
    EXPECT_EQ(fromStr<ColorMode>("COLOR_MODE_RGB"), COLOR_MODE_RGB);
    EXPECT_EQ(fromStr<ColorMode>("COLOR_MODE_END"), COLOR_MODE_END);

    // every name once, in order
    const std::string values = enumValues<ColorMode>();
    std::string joined;
    for (int i = 0; i <= COLOR_MODE_END; ++i) joined += std::string(i ? ", " : "") + toStr(ColorMode(i));
    EXPECT_EQ(values, joined);

    // the token stops at each of the separators and leaves it in the stream
    for (const char separator : std::string("\t\n ),")) {
        std::istringstream stream(std::string("COLOR_MODE_MONO16") + separator + "rest");
        ColorMode mode = COLOR_MODE_UNDEFINED;
        readEnum(stream, mode);
        EXPECT_EQ(mode, COLOR_MODE_MONO16);
        EXPECT_EQ(stream.get(), separator);
    }

    const FailedCheck check = catchCheck([] { fromStr<ColorMode>("COLOR_MODE_PINK"); });
    EXPECT_EQ(check.expression, "0");
    EXPECT_EQ(check.tail, "cannot parse enum ColorMode from `COLOR_MODE_PINK`. Use one of " + values);
    // a prefix of a name is no name
    EXPECT_TRUE(catchCheck([] { fromStr<ColorMode>("COLOR_MODE_MONO1"); }).thrown);
}
