#include <gtest/gtest.h>

#include <sstream>

#include "LQ_IniParser.h"
#include "LogCapture.h"

using LQ::IniParser;

namespace {
std::vector<std::string> allKeys(const IniParser& parser) {
    std::vector<std::string> keys{"stale"};
    parser.getAllKeys(keys);
    return keys;
}
}  // namespace

TEST(IniParser, SectionsLoadSaveAndMerge) {
    std::istringstream text(
        "# settings\n"
        " top = 1\n"
        "\n"
        "[camera]\n"
        "  width = 640 # pixels\n"
        "\tname = \"front cam\"\n"
        "[empty]\n"
        "[detector]\n"
        "scale=0.5\n");
    IniParser parser;
    EXPECT_EQ(parser.load(text), 0);
    EXPECT_EQ(allKeys(parser),
              (std::vector<std::string>{"top", "camera/name", "camera/width", "detector/scale"}));
    EXPECT_EQ(parser.getKey("camera/name", ""), "front cam");
    EXPECT_EQ(parser.getKey("top", ""), "1");
    EXPECT_TRUE(parser.hasKey("detector", "scale"));
    EXPECT_FALSE(parser.hasKey("empty", "scale"));  // a heading with no keys leaves no trace
    // a missing key gives the default and creates nothing
    EXPECT_EQ(parser.getKey("camera/height", "360"), "360");
    EXPECT_EQ(parser.getKey("nowhere/height", "360"), "360");
    EXPECT_EQ(allKeys(parser).size(), 4u);

    std::ostringstream saved;
    EXPECT_TRUE(parser.save(saved));
    EXPECT_EQ(saved.str(),
              "top = 1\n"
              "\n[camera]\n  name = front cam\n  width = 640\n"
              "\n[detector]\n  scale = 0.5\n");
    IniParser reloaded;
    std::istringstream savedText(saved.str());
    EXPECT_EQ(reloaded.load(savedText), 0);
    std::ostringstream savedAgain;
    reloaded.save(savedAgain);
    EXPECT_EQ(savedAgain.str(), saved.str());

    // a second load overwrites only the keys it names
    std::istringstream more("[camera]\nwidth = 1280\n");
    EXPECT_EQ(parser.load(more), 0);
    EXPECT_EQ(parser.getKey("camera/width", ""), "1280");
    EXPECT_EQ(parser.getKey("camera/name", ""), "front cam");

    parser.setKey("new/a/b", "v");
    EXPECT_TRUE(parser.hasKey("new", "a/b"));  // the first separator splits
    EXPECT_TRUE(parser.hasKey("new/a/b"));
    parser.reset();
    EXPECT_TRUE(allKeys(parser).empty());

    // the comment character is the constructor's
    IniParser semicolons(';');
    std::istringstream withHash("key = a # b ; c\n");
    EXPECT_EQ(semicolons.load(withHash), 0);
    EXPECT_EQ(semicolons.getKey("key", ""), "a # b");
}

TEST(IniParser, FirstBadLineAndItsError) {
    const struct {
        const char* text;
        int result;
        const char* error;
    } cases[] = {
        {"", 0, ""},
        {"ok = 1\n[]\n", 2, "[error] Incorrect section name: '[]'\n"},
        {"[a b]\n", 1, "[error] Incorrect section name: '[a b]'\n"},
        {"[open\n", 1, "[error] Incorrect section name: '[open'\n"},
        {"x = 1\n", 1, "[error] Incorrect 'key-value' pair: 'x = 1'\n"},
        {"xy = 1\n", 0, ""},
        {"my-key = 1\n", 1, "[error] Incorrect 'key-value' pair: 'my-key = 1'\n"},
        {"\n\nkey = a=b\n", 3, "[error] Incorrect 'key-value' pair: 'key = a=b'\n"},
        {"key = \"a=b\"\n", 1, "[error] Incorrect 'key-value' pair: 'key = \"a=b\"'\n"},
        {"good = 1\nno equals\n", 2,
         "[error] No '=' found in line 'no equals'\n[error] Incorrect 'key-value' pair: 'no equals'\n"},
    };
    for (const auto& c : cases) {
        IniParser parser;
        std::istringstream text(c.text);
        ::testing::internal::CaptureStderr();
        EXPECT_EQ(parser.load(text), c.result) << c.text;
        EXPECT_EQ(::testing::internal::GetCapturedStderr(), c.error) << c.text;
    }

    // what was read before the bad line stays
    IniParser partial;
    std::istringstream text("good = 1\n[s]\nbad\nlater = 2\n");
    ::testing::internal::CaptureStderr();
    EXPECT_EQ(partial.load(text), 3);
    ::testing::internal::GetCapturedStderr();
    EXPECT_EQ(allKeys(partial), std::vector<std::string>{"good"});

    // a comment character cuts a quoted value too, which then lacks its closing quote
    IniParser quoted;
    std::istringstream cut("key = \"a # b\"\n");
    const FailedCheck check = catchCheck([&] { quoted.load(cut); });
    EXPECT_TRUE(check.thrown);
    EXPECT_EQ(check.tail, "Closing quote is missing in the end of value: a");

    ::testing::internal::CaptureStderr();
    EXPECT_EQ(quoted.load("/nonexistent/settings.ini"), -1);
    EXPECT_EQ(::testing::internal::GetCapturedStderr(),
              "[error] Cannot read file '/nonexistent/settings.ini'\n");
    EXPECT_FALSE(quoted.save("/nonexistent/settings.ini"));
}

TEST(IniParser, KeyValueSplitting) {
    std::string key, value;
    EXPECT_TRUE(LQ::splitKeyValue("  name = \"a value\" ", key, value));
    EXPECT_EQ(key, "name");
    EXPECT_EQ(value, "a value");
    // the parts are filled in even when the split reports false
    EXPECT_FALSE(LQ::splitKeyValue("x=1", key, value));
    EXPECT_EQ(key, "x");
    EXPECT_FALSE(LQ::splitKeyValue("--long=1=2", key, value));
    EXPECT_EQ(key, "--long");
    EXPECT_EQ(value, "1=2");
    EXPECT_EQ(catchCheck([&] { LQ::splitKeyValue("k=\"open", key, value); }).tail,
              "Closing quote is missing in the end of value: open");
    EXPECT_EQ(LQ::trim(" \t a b \t"), "a b");
    EXPECT_EQ(LQ::trim(" \n "), "\n");  // only blanks and tabs
    EXPECT_EQ(LQ::cleanFromComments("a = 1 # b # c", '#'), "a = 1 ");
}
