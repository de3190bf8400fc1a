#include <gtest/gtest.h>

#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "LQ_Stream.h"
#include "LogCapture.h"

using namespace LQ;

namespace {
template <class T>
std::string printed(const T& value) {
    std::ostringstream stream;
    StreamO(stream) << value;
    return stream.str();
}
}  // namespace

// strings quoted and escaped, floats with seven digits and doubles sixteen, containers
TEST(StreamPrint, quotingDigitsAndContainers) {
    EXPECT_EQ(printed(std::string("a\"b")), "\"a\\\"b\"");
    EXPECT_EQ(printed(std::string("c:\\dir\\")), "\"c:\\\\dir\\\\\"");
    // literals are the caller's own markup and go out as they are
    EXPECT_EQ(printed("Size("), "Size(");
    EXPECT_EQ(printed(1.0f / 3), "0.3333333");
    EXPECT_EQ(printed(1.0 / 3), "0.3333333333333333");
    EXPECT_EQ(printed(0.1f), "0.1");
    EXPECT_EQ(printed(1234567.f), "1234567");
    EXPECT_EQ(printed(123456789.f), "1.234568e+08");

    // the precision is left on the stream
    std::ostringstream stream;
    StreamO(stream) << 0.5f;
    stream << 2.0 / 3;
    EXPECT_EQ(stream.str(), "0.50.6666667");
    EXPECT_EQ(printed(std::vector<int>{1, -2, 3}), "vector[3](1, -2, 3)");
    EXPECT_EQ(printed(std::vector<float>{1.0f / 3, 2}), "vector[2](0.3333333, 2)");
    EXPECT_EQ(printed(std::vector<std::string>{"a", "b\"c"}), "vector[2](\"a\", \"b\\\"c\")");
    EXPECT_EQ(printed(std::vector<std::vector<int>>{{1}, {}}), "vector[2](vector[1](1), vector[0]())");
    const std::map<std::string, int> counts = {{"thumb", 2}, {"fist", 1}};
    EXPECT_EQ(printed(counts), "map[2](\"fist\" = 1, \"thumb\" = 2)");
}

TEST(StreamRead, quotedStringsComeBackAndBadInputIsRefused) {
    const std::vector<std::string> texts = {"a\"b", "\\", "\\\"", "", "with space", "line\nbreak", "\"\""};
    std::stringstream stream;
    StreamO out(stream);
    for (const std::string& text : texts) out << text;
    StreamI in(stream);
    for (const std::string& text : texts) {
        std::string back = "stale";
        in >> back;
        EXPECT_EQ(back, text);
    }

    // a quoted string ends at its closing quote; what follows stays for the next read
    std::istringstream mixed("\"ab\" 12");
    StreamI mixedIn(mixed);
    std::string word;
    int number = 0;
    mixedIn >> word >> number;
    EXPECT_EQ(word, "ab");
    EXPECT_EQ(number, 12);

    struct Case {
        const char *input, *expression, *tail;
    };
    const Case cases[] = {
        {"abc", "0", "cannot find starting \": a"},
        {" \"a\"", "0", "cannot find starting \":  "},
        {"\"ab\\x\"", "c == '\\\\' || c == '\\\"'", "wrong escaped character xafter ab"},
        {"\"abc", "stream_", "error during parsing stream"},
        {"\"ab\\", "stream_", "error during parsing stream"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.input);
        const FailedCheck check = catchCheck([&] {
            std::istringstream stream(c.input);
            StreamI in(stream);
            std::string text;
            in >> text;
        });
        EXPECT_EQ(check.expression, c.expression);
        EXPECT_EQ(check.tail, c.tail);
    }

    const FailedCheck check = catchCheck([] {
        std::istringstream empty;
        empty.setstate(std::ios::badbit);
        StreamI in(empty);
    });
    EXPECT_EQ(check.expression, "stream_");
    EXPECT_EQ(check.tail, "empty stream");
}
