#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>

#include "LQ_CommandLineParser.h"
#include "LogCapture.h"

using LQ::CommandLineParser;

namespace {
// the engine's kind of parser: a flag, a string, an int, a float and a required bool
CommandLineParser engineParser() {
    CommandLineParser parser("Usage: engine", "See the manual.");
    parser.add("-f", "--flip", "false", false, 4, "Flip output results position corresponding first image.");
    parser.add("-m", "--mode", "", false, 1, "Gesture to look for");
    parser.add("-n", "--count", "3", false, 2, "How many");
    parser.add("", "--scale", "", false, 3, "Scale\nof the frame");
    parser.add("-v", "--verbose", "", false, 0, "Talk more");
    return parser;
}

std::string writeFile(const std::string& name, const std::string& text) {
    const std::string path = ::testing::TempDir() + name;
    std::ofstream(path) << text;
    return path;
}
}  // namespace

TEST(CommandLineParser, GrammarOfLongAndShortKeys) {
    CommandLineParser parser = engineParser();
    parser.parse(" --mode=\"thumb up\" -n -12 --verbose --scale=0.5=half --flip=yes");
    EXPECT_EQ(parser.getString("--mode"), "thumb up");  // one argument, quotes gone
    EXPECT_EQ(parser.getInt("-n"), -12);
    EXPECT_TRUE(parser.isSet("--verbose"));
    EXPECT_EQ(parser.getString("--verbose"), "");
    EXPECT_EQ(parser.getString("--scale"), "0.5=half");  // a second "=" stays in the value
    EXPECT_TRUE(parser.getBool("-f"));
    EXPECT_EQ(parser.getAllArgs(), (std::vector<std::string>{"--mode=\"thumb up\"", "-n", "-12", "--verbose",
                                                             "--scale=0.5=half", "--flip=yes"}));
    EXPECT_EQ(parser.getArgsString(),
              "--count=\"-12\" --flip=\"yes\" --mode=\"thumb up\" --scale=\"0.5=half\" --verbose=\"\" ");

    // values read back by type, defaults where nothing was given
    CommandLineParser fresh = engineParser();
    fresh.parse(std::string("--scale={ 2.5 }"));
    EXPECT_EQ(fresh.getInt("--count"), 3);
    EXPECT_FALSE(fresh.getBool("--flip"));
    EXPECT_FLOAT_EQ(fresh.getFloat("--scale"), 2.5f);
    EXPECT_FALSE(fresh.isSet("--mode"));
    fresh.setDefaultValue("-n", "4");  // either spelling finds the key
    EXPECT_EQ(fresh.getInt("--count"), 4);

    // a bare word only warns and is kept; parsing goes on behind it
    CommandLineParser lenient = engineParser();
    LogCapture log;
    lenient.parse(std::vector<std::string>{"stray", "--mode=fist", "--other=1"});
    EXPECT_EQ(lenient.getString("--mode"), "fist");
    EXPECT_EQ(lenient.getUnrecognizedArgs(), (std::vector<std::string>{"stray", "--other=1"}));
    EXPECT_NE(log.text().find("Unrecognized key: stray"), std::string::npos);
    EXPECT_NE(log.text().find("unrecognized key --other"), std::string::npos);
    lenient.reset();
    EXPECT_FALSE(lenient.isSet("--mode"));
}

TEST(CommandLineParser, FailureTexts) {
    const struct {
        std::string text;
        std::string tail;
    } cases[] = {
        {"--mode=\"open", "Closing '\"' isn't found: --mode=\"open"},
        {"--mode={a b", "Closing } isn't found: --mode={a b"},
        {"--mode fist", "key '--mode' is a long key. Please, use '--long-key=value' syntax"},
        {"-m", "key '-m' has less than required count of arguments"},
        {"-m -n", "key '-m' has less than required count of arguments"},
        {"-m=fist", "key '-m' is not a long key"},
        {"--m=fist", "key '--m' is not a long key"},
        {"-i", "no argument to -i"},
        {"--import /nonexistent/options.txt", "can't open file "},
    };
    for (const auto& c : cases) {
        CommandLineParser parser = engineParser();
        const FailedCheck check = catchCheck([&] { parser.parse(c.text); });
        EXPECT_TRUE(check.thrown) << c.text;
        EXPECT_EQ(check.tail, c.tail) << c.text;
    }

    // "--import" with a blank: the split finds no "=", so the file name is empty
    CommandLineParser blank = engineParser();
    ::testing::internal::CaptureStderr();
    catchCheck([&] { blank.parse("--import options.txt"); });
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "[error] No '=' found in line '--import'\n");

    CommandLineParser parser = engineParser();
    parser.parse("--mode=x --scale=1.2.3 --flip=TRUE");
    EXPECT_EQ(catchCheck([&] { parser.getInt("--mode"); }).tail, "value for --mode: type of 'x' is not Int");
    EXPECT_EQ(catchCheck([&] { parser.getInt("--scale"); }).tail,
              "value for --scale: type of '1.2.3' is not Int");
    EXPECT_FLOAT_EQ(parser.getFloat("--scale"), 1.2f);  // the check passes, the stream reads what it can
    EXPECT_EQ(catchCheck([&] { parser.getBool("--flip"); }).tail, "convert error for the key '--flip'");
    EXPECT_EQ(catchCheck([&] { parser.getBool("--mode"); }).tail, "convert error for the key '--mode'");
    EXPECT_EQ(catchCheck([&] { parser.getBool("--verbose"); }).tail, "convert error for the key '--verbose'");
    EXPECT_EQ(catchCheck([&] { parser.getString("--nothing"); }).tail, "unknown key '--nothing'");
    EXPECT_EQ(catchCheck([&] { parser.isSet("--nothing"); }).tail, "key '--nothing' doesn't exists");
    EXPECT_EQ(catchCheck([&] { parser.setDefaultValue("--nothing", "1"); }).tail, "key --nothing is not set");
    EXPECT_EQ(catchCheck([&] { parser.import("/nonexistent/options.txt"); }).tail,
              "Cannot read file '/nonexistent/options.txt'");
    EXPECT_EQ(catchCheck([&] { LQ::getRawValue("\"open"); }).tail, "no closing \" in \"open");

    CommandLineParser strict("head", "tail");
    strict.add("-r", "--required", "", true, 1, "must be there");
    strict.add("", "--also", "", true, 4, "this too");
    EXPECT_EQ(catchCheck([&] { strict.parse("--also=1"); }).tail,
              "some required key(s) missed: '-r' '--required'");
    strict.reset();
    EXPECT_EQ(catchCheck([&] { strict.parse(""); }).tail,
              "some required key(s) missed: '-r' '--required' '--also'");
}

TEST(CommandLineParser, ImportsCommentsAndUsage) {
    const std::string inner =
        writeFile("tactus_inner.txt", "--count=7 # a comment --mode=ignored\n--verbose\n");
    const std::string outer = writeFile("tactus_outer.txt", "-i " + inner + "\n--mode=\"from file\"\n");
    CommandLineParser parser = engineParser();
    parser.parse("--import=" + outer + " --flip=1");
    EXPECT_EQ(parser.getInt("--count"), 7);
    EXPECT_EQ(parser.getString("--mode"), "from file");
    EXPECT_TRUE(parser.isSet("-v"));
    EXPECT_TRUE(parser.getBool("--flip"));

    // "#" starts a comment only in text read from a stream
    CommandLineParser tokens = engineParser();
    LogCapture log;
    tokens.parse(std::vector<std::string>{"#", "--count=5"});
    EXPECT_EQ(tokens.getInt("--count"), 5);
    EXPECT_EQ(tokens.getUnrecognizedArgs(), std::vector<std::string>{"#"});

    // a file that imports itself stops at the nesting limit
    const std::string loop = ::testing::TempDir() + "tactus_loop.txt";
    writeFile("tactus_loop.txt", "--count=1 -i " + loop + "\n");
    CommandLineParser looping = engineParser();
    const FailedCheck check = catchCheck([&] { looping.parse("-i " + loop); });
    EXPECT_TRUE(check.thrown);
    EXPECT_EQ(check.tail, "imports nest deeper than 16 levels at " + loop);

    std::ostringstream usage;
    engineParser().printUsage(usage);
    EXPECT_EQ(usage.str(),
              "Usage: engine\n\n"
              " -h, --help\n   [Parser] Print help\n \n"
              " -i STRING, --import=STRING\n   [Parser] Load command line parameters from file\n \n"
              " -f false, --flip=false\n   Flip output results position corresponding first image.\n \n"
              " -m STRING, --mode=STRING\n   Gesture to look for\n \n"
              " -n 3, --count=3\n   How many\n \n"
              " --scale=FLOAT\n   Scale\n   of the frame\n \n"
              " -v, --verbose\n   Talk more\n \n"
              "See the manual.\n\n");

    std::vector<std::pair<std::string, std::string>> pairs;
    LQ::parseString("-a 1 -b --long=\"x y\" --bare", pairs);
    EXPECT_EQ(pairs, (std::vector<std::pair<std::string, std::string>>{
                         {"a", "1"}, {"b", ""}, {"long", "x y"}, {"bare", ""}}));
    EXPECT_EQ(catchCheck([&] { LQ::parseString("-a 1 2", pairs); }).tail, "cannot find key in -a 1 2");
    EXPECT_EQ(catchCheck([&] { LQ::parseString("-", pairs); }).tail, "cannot find key in -");
}

TEST(CommandLineParser, HelpPrintsUsageAndEnds) {
    const std::string out = ::testing::TempDir() + "tactus_help.txt";
    std::remove(out.c_str());
    EXPECT_EXIT(
        {
            if (!std::freopen(out.c_str(), "w", stdout)) std::abort();
            CommandLineParser parser = engineParser();
            parser.add("-r", "--required", "", true, 1, "help wins over a missing key");
            parser.parse("--count=x -h");
        },
        ::testing::ExitedWithCode(0), "");
    CommandLineParser expected = engineParser();
    expected.add("-r", "--required", "", true, 1, "help wins over a missing key");
    std::ostringstream usage;
    expected.printUsage(usage);
    std::ifstream printed(out);
    std::stringstream text;
    text << printed.rdbuf();
    EXPECT_EQ(text.str(), usage.str());
}
