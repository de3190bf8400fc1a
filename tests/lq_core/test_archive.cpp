#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "LQ_ArchiveI.h"
#include "LQ_ArchiveO.h"
#include "LQ_ImageArchive.h"
#include "LogCapture.h"

using namespace LQ;

namespace {
const char* const LITERAL_EXPRESSION = "(std::string(value) == buffer) && (std::istream&)(stream_)";

template <class T>
std::string bytesOf(const T& value) {
    std::ostringstream stream;
    ArchiveO archive(stream);
    archive & value;
    return stream.str();
}

template <class T>
T readBack(const std::string& bytes, const std::string& version = "") {
    std::istringstream stream(bytes);
    ArchiveI archive(stream);
    archive.setVersion(version);
    T value{};
    archive & value;
    return value;
}

struct Record {
    std::string name;
    int value = 0;
};
ArchiveI& operator&(ArchiveI& archive, Record& record) {
    return archive & record.name & "\n" & record.value;
}
}  // namespace

TEST(ArchiveRoundTrip, everyEncodingComesBackInOrder) {
    std::stringstream stream;
    ArchiveO out(stream);
    const std::vector<std::string> names = {"palm", "fist"};
    const std::vector<float> weights = {0.5f, -1e-20f, 3.25f};
    out & true & 'x' & static_cast<short>(-300) & 0xDEADBEEFu & 1.0 / 3 & COLOR_MODE_BGR &
        std::string("hello world") & "\n" & names & weights & std::vector<Size>{Size(3, 4)} & PointF(1.5f, -2) &
        Rect(1, 2, 3, 4) & std::vector<int>();

    ArchiveI in(stream);
    bool b = false;
    char c = 0;
    short s = 0;
    unsigned int u = 0;
    double d = 0;
    ColorMode mode = COLOR_MODE_UNDEFINED;
    std::string text;
    std::vector<int> empty = {42};
    std::vector<std::string> names2;
    std::vector<float> weights2;
    std::vector<Size> sizes;
    PointF point;
    Rect rect;
    in & b & c & s & u & d & mode & text & "\n" & names2 & weights2 & sizes & point & rect & empty;

    EXPECT_TRUE(b);
    EXPECT_EQ(c, 'x');
    EXPECT_EQ(s, -300);
    EXPECT_EQ(u, 0xDEADBEEFu);
    EXPECT_EQ(d, 1.0 / 3);
    EXPECT_EQ(mode, COLOR_MODE_BGR);
    EXPECT_EQ(text, "hello world");
    EXPECT_EQ(names2, names);
    EXPECT_EQ(weights2, weights);
    EXPECT_EQ(sizes, std::vector<Size>{Size(3, 4)});
    EXPECT_EQ(point, PointF(1.5f, -2));
    EXPECT_EQ(rect, Rect(1, 2, 3, 4));
    EXPECT_TRUE(empty.empty());
    EXPECT_EQ(stream.peek(), std::char_traits<char>::eof());

    // a stored byte other than 0 and 1 still reads as a proper bool
    EXPECT_TRUE(readBack<bool>(std::string(1, '\x07')));
}

TEST(ArchiveLayout, memoryImagesWithoutGapsOrLengths) {
    using namespace std::string_literals;
    EXPECT_EQ(bytesOf(0x01020304), "\x04\x03\x02\x01"s);
    EXPECT_EQ(bytesOf(1.0f), "\x00\x00\x80\x3f"s);
    EXPECT_EQ(bytesOf(true), "\x01"s);
    EXPECT_EQ(bytesOf(COLOR_MODE_RGBA), "\x09\x00\x00\x00"s);
    EXPECT_EQ(bytesOf(std::vector<int>{7, -1}), "\x02\x00\x00\x00\x07\x00\x00\x00\xff\xff\xff\xff"s);
    EXPECT_EQ(bytesOf(Size(3, 5)), "\x03\x00\x00\x00\x05\x00\x00\x00"s);
    EXPECT_EQ(bytesOf(std::string("ab")), "ab\0"s);
    EXPECT_EQ(bytesOf("\n"), "\n"s);
    EXPECT_EQ(bytesOf(std::vector<std::string>{"a", ""}),
              "\x02\x00\x00\x00"
              "a\0\0"s);

    std::ostringstream stream;
    ArchiveO archive(stream);
    archive.write("xyz", 2).write(std::vector<float>{2.0f}.data(), 1);
    EXPECT_EQ(stream.str(), "xy\x00\x00\x00\x40"s);
}

TEST(ArchiveLiteral, marksAreVerifiedAndRefusedWithTheirText) {
    struct Case {
        std::string input;
        const char *mark, *tail;
    };
    const Case cases[] = {
        {"x", "\n", "cannot read \"\n\" from \"x"},
        {"", "\n", "cannot read \"\n\" from \""},                    // missing at the end
        {"Vers", "Version", "cannot read \"Version\" from \"Vers"},  // cut short
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.input);
        const FailedCheck check = catchCheck([&] {
            std::istringstream stream(c.input);
            ArchiveI in(stream);
            in & c.mark;
        });
        EXPECT_EQ(check.expression, LITERAL_EXPRESSION);
        EXPECT_EQ(check.tail, c.tail);
        EXPECT_EQ(check.function, "operator&");
    }

    const std::string longest(255, 'm'), tooLong(256, 'm');
    std::istringstream marks(bytesOf(longest.c_str()));
    ArchiveI in(marks);
    EXPECT_NO_THROW(in & longest.c_str());
    const FailedCheck check = catchCheck([&] {
        std::istringstream stream(bytesOf(tooLong.c_str()));
        ArchiveI archive(stream);
        archive & tooLong.c_str();
    });
    EXPECT_EQ(check.expression, "size < MAX_BUFFER_SIZE");
    EXPECT_EQ(check.tail, "wrong str size 256 >= 256");

    const FailedCheck failedStream = catchCheck([] {
        std::istringstream stream;
        stream.setstate(std::ios::failbit);
        ArchiveI archive(stream);
    });
    EXPECT_EQ(failedStream.expression, "stream_");
    EXPECT_EQ(failedStream.tail, "empty stream");
}

TEST(ArchiveString, lengthLimitEmptyStringAndNulInside) {
    const std::string longest(999, 'q');
    EXPECT_EQ(readBack<std::string>(bytesOf(longest)), longest);
    const FailedCheck check = catchCheck([] { readBack<std::string>(bytesOf(std::string(1000, 'q'))); });
    EXPECT_EQ(check.expression, "buffer[MAX_BUFFER_SIZE - 1] == 0");
    EXPECT_EQ(check.tail, "too large string");

    // an empty string reads as empty but fails the stream, so the next value is lost
    std::stringstream stream;
    ArchiveO out(stream);
    out & std::string() & 5;
    ArchiveI in(stream);
    std::string text = "before";
    int next = 0;
    in & text & next;
    EXPECT_EQ(text, "");
    EXPECT_TRUE(stream.fail());
    EXPECT_NE(next, 5);

    // the writer stops at a NUL inside, so the fields behind stay readable
    std::stringstream withNul;
    ArchiveO out2(withNul);
    out2 & std::string("ab\0cd", 5) & 9;
    ArchiveI in2(withNul);
    in2 & text & next;
    EXPECT_EQ(text, "ab");
    EXPECT_EQ(next, 9);
}

TEST(ArchiveVersion, orderingAndFieldsFromVersion) {
    EXPECT_TRUE(isVersionBefore("Version 2", "Version 8"));
    EXPECT_FALSE(isVersionBefore("Version 8", "Version 8"));
    EXPECT_TRUE(isVersionBefore("", "Version 2"));
    EXPECT_TRUE(isVersionBefore("Version", "Version 2"));  // a prefix comes first
    EXPECT_TRUE(isVersionBefore("Version 10", "Version 2"));

    std::ostringstream written;
    ArchiveO out(written);
    out.archiveFromVersion("Version 2", 1);  // empty version: before everything, skipped
    out.setVersion("Version 8");
    out.archiveFromVersion("Version 7", 2)
        .archiveFromVersion("Version 8", 3)
        .archiveFromVersion("Version 9", 4);
    EXPECT_EQ(written.str(), bytesOf(2) + bytesOf(3));

    struct Case {
        const char* version;
        int expected;
    };
    for (const Case& c : {Case{"Version 7", 11}, Case{"Version 6", -1}, Case{"", -1}}) {
        SCOPED_TRACE(c.version);
        std::istringstream stream(bytesOf(11));
        ArchiveI in(stream);
        in.setVersion(c.version);
        int field = -1;
        in.archiveFromVersion("Version 7", field);
        EXPECT_EQ(field, c.expected);
    }
}

TEST(ArchiveVector, textualCountBeforeVersion6) {
    const std::string elements = bytesOf(7) + bytesOf(8) + bytesOf(9);
    EXPECT_EQ(readBack<std::vector<int>>(" 3" + elements, "Version 5"), (std::vector<int>{7, 8, 9}));
    EXPECT_EQ(readBack<std::vector<int>>("\n12" + std::string(12 * 4, '\x01'), "Version 2").size(), 12u);
    // from "Version 6", and with no version at all, the count is raw
    for (const char* version : {"Version 6", "Version 8", ""}) {
        SCOPED_TRACE(version);
        EXPECT_EQ(readBack<std::vector<int>>(bytesOf(3u) + elements, version), (std::vector<int>{7, 8, 9}));
    }
    // the writer always writes the raw count
    std::ostringstream stream;
    ArchiveO out(stream);
    out.setVersion("Version 5");
    out & std::vector<int>{7, 8, 9};
    EXPECT_EQ(stream.str(), bytesOf(3u) + elements);
}

TEST(ArchiveFile, loadReadsAnObjectAndRefusesAMissingFile) {
    const std::string fileName = ::testing::TempDir() + "tactus_archive_record.bin";
    {
        std::ofstream file(fileName, std::ios::binary);
        ArchiveO out(file);
        out & std::string("thumb") & "\n" & 55000;
    }
    Record record;
    ArchiveI::load(fileName, record);
    EXPECT_EQ(record.name, "thumb");
    EXPECT_EQ(record.value, 55000);
    std::remove(fileName.c_str());

    const std::string missing = ::testing::TempDir() + "tactus_no_such_dir/none.nn";
    const FailedCheck check = catchCheck([&] { ArchiveI::load(missing, record); });
    EXPECT_EQ(check.expression, "file");
    EXPECT_EQ(check.tail, "cannot open " + missing);
}

TEST(ArchiveImage, roundTripWritesRowsWithoutPadding) {
    Image color(Size(5, 3), COLOR_MODE_BGR);
    for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 15; ++x) color.row(y)[x] = static_cast<unsigned char>(y * 40 + x);
    const std::string bytes = bytesOf(color);
    EXPECT_EQ(bytes.size(), 8u + 4u + 5 * 3 * 3);
    EXPECT_EQ(bytes.substr(0, 12), bytesOf(Size(5, 3)) + bytesOf(COLOR_MODE_BGR));
    EXPECT_TRUE(readBack<Image>(bytes) == color);

    // a reference into a wider image: its rows are 10 bytes apart, only 4 of each are its own;
    // reading replaces whatever the target held
    Image big(Size(10, 6), COLOR_MODE_MONO);
    std::string expectedPixels;
    for (int y = 0; y < 6; ++y)
        for (int x = 0; x < 10; ++x) big.row(y)[x] = static_cast<unsigned char>(10 * y + x);
    for (int y = 1; y < 4; ++y)
        for (int x = 2; x < 6; ++x) expectedPixels += static_cast<char>(10 * y + x);
    Image part;
    part.createRef(big, Rect(2, 1, 6, 4));
    const std::string partBytes = bytesOf(part);
    EXPECT_EQ(partBytes, bytesOf(Size(4, 3)) + bytesOf(COLOR_MODE_MONO) + expectedPixels);
    std::istringstream stream(partBytes);
    ArchiveI in(stream);
    Image target(Size(2, 2), COLOR_MODE_FLOAT);
    in & target;
    EXPECT_TRUE(target == part);
}

TEST(SizeParse, readsItsPrintFormAndNamesTheBadPiece) {
    std::stringstream printed;
    printed << Size(640, -360) << Size(0, 7);
    Size first, second;
    printed >> first >> second;
    EXPECT_EQ(first, Size(640, -360));
    EXPECT_EQ(second, Size(0, 7));

    struct Case {
        const char *text, *mark, *tail;
    };
    const Case cases[] = {
        {"Size[1, 2)", "Size(", "cannot parse `Size(` from `Size[`"},
        {"Size(1; 2)", ", ", "cannot parse `, ` from `; `"},
        {"Size(a, 2)", ", ", "cannot parse `, ` from ``"},  // a failed number
        {"Size(1, 2", ")", "cannot parse `)` from ``"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        const FailedCheck check = catchCheck([&] {
            std::istringstream stream(c.text);
            Size size;
            stream >> size;
        });
        EXPECT_EQ(check.expression,
                  "(std::string(\"" + std::string(c.mark) + "\") == buffer) && (std::istream&)(stream)");
        EXPECT_EQ(check.tail, c.tail);
    }

    // the plain-stream form for fixed headers of text files
    std::istringstream header("Ring 3");
    EXPECT_NO_THROW(readString(header, "Ring "));
    EXPECT_EQ(header.get(), '3');
    FailedCheck check = catchCheck([] {
        std::istringstream stream("abx");
        readString(stream, "abc");
    });
    EXPECT_EQ(check.expression, "str == buffer && stream");
    EXPECT_EQ(check.tail, "cannot read \"abc\" from \"abx");
    check = catchCheck([] {
        std::istringstream stream(std::string(300, 'a'));
        readString(stream, std::string(256, 'a'));
    });
    EXPECT_EQ(check.expression, "str.size() < MAX_BUFFER_SIZE");
    EXPECT_EQ(check.tail, "wrong str size 256 >= 256");
}
