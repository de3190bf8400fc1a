#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <ctime>
#include <filesystem>
#include <fstream>

#include "LQ_FileUtils.h"
#include "LQ_Utils.h"
#include "LogCapture.h"

namespace {
std::vector<std::string> sorted(std::vector<std::string> list) {
    std::sort(list.begin(), list.end());
    return list;
}

// A scratch tree removed at the end of the test.
struct ScratchTree {
    std::string root = ::testing::TempDir() + "tactus_files_" + std::to_string(getpid());
    ScratchTree() { std::filesystem::remove_all(root); }
    ~ScratchTree() { std::filesystem::remove_all(root); }
    std::string write(const std::string& name, const std::string& text) const {
        std::ofstream(root + "/" + name) << text;
        return root + "/" + name;
    }
};
}  // namespace

TEST(FileUtils, PathTexts) {
    EXPECT_EQ(LQ::getFileName("a/b.d/c.txt"), "c.txt");
    EXPECT_EQ(LQ::getFileName("a/"), "");
    EXPECT_EQ(LQ::getFileDirectory("a/b.d/c.txt"), "a/b.d");
    EXPECT_EQ(LQ::getFileDirectory("/c.txt"), "");
    // only the name's last dot counts, never a directory's
    EXPECT_EQ(LQ::getFileExtention("v1.2/archive.tar.gz"), ".gz");
    EXPECT_EQ(LQ::getFileExtention("v1.2/README"), "");
    EXPECT_EQ(LQ::getFileNameBase("v1.2/archive.tar.gz"), "archive.tar");
    EXPECT_EQ(LQ::fixSeparator("a\\b\\c"), "a/b/c");
    EXPECT_EQ(LQ::fixPath("C:\\$HOME\\my dir"), "\"C:/\\$HOME/my dir\"");
    EXPECT_TRUE(LQ::checkExtensions("clip.MOV", LQ::getSupportedVideoExtentions()));
    EXPECT_FALSE(LQ::checkExtensions("clip.mov", LQ::getSupportedVideoExtentions()));
    EXPECT_FALSE(LQ::checkExtensions("g", {".jpg"}));

    EXPECT_TRUE(LQ::isFullPath("/x"));
    const FailedCheck empty = catchCheck([] { LQ::isFullPath(""); });
    EXPECT_EQ(empty.expression, "path.length() >= MIN_PATH_LENGTH");
    EXPECT_EQ(empty.tail, "'' seems to be not a directory");
}

TEST(FileUtils, FilesAndDirectories) {
    const ScratchTree tree;
    const std::string& root = tree.root;
    EXPECT_FALSE(LQ::isDirectory(root));
    LQ::createParentDirectories(root + "/sub/deep/ignored.png");
    LQ::createParentDirectories("no-slash-does-nothing");
    EXPECT_TRUE(LQ::isDirectory(root + "/sub/deep"));
    EXPECT_FALSE(LQ::isFileExists(root + "/sub/deep/ignored.png"));
    LQ::createParentDirectories(root + "/-dash/x");  // sorts before "..": no directory to list

    const std::string jpg = tree.write("a.jpg", "hello");
    tree.write("b.txt", "");
    tree.write("sub/c.png", "png");
    tree.write("sub/deep/d.MOV", "");
    tree.write("sub/deep/e.mov", "");

    EXPECT_TRUE(LQ::isFileExists(jpg));
    EXPECT_FALSE(LQ::isDirectory(jpg));
    EXPECT_EQ(LQ::getFileSize(jpg), 5);
    EXPECT_EQ(LQ::getFileSize(root + "/none"), -1);
    EXPECT_EQ(LQ::getFileSize(root), -1);
    EXPECT_EQ(LQ::cat(jpg), "hello");
    EXPECT_LE(std::abs(LQ::getModificationTime(jpg) - static_cast<long>(std::time(nullptr))), 60);
    const FailedCheck missing = catchCheck([&] { LQ::getModificationTime(root + "/none"); });
    EXPECT_EQ(missing.expression, "!status");
    EXPECT_EQ(missing.tail, "error during getting modification time of " + root + "/none");
    EXPECT_EQ(LQ::getCurrentDirectory(), std::filesystem::current_path().string());

    std::vector<std::string> list{"kept"};
    EXPECT_TRUE(LQ::readDirectories(root, list, false));
    EXPECT_EQ(list[0], "kept");
    EXPECT_EQ(list[1], root);  // the path comes first
    EXPECT_EQ(sorted(list), sorted({"kept", root, root + "/sub"}));
    list.clear();
    EXPECT_TRUE(LQ::readDirectories(root, list, true));
    EXPECT_EQ(list, (std::vector<std::string>{root, root + "/sub", root + "/sub/deep"}));
    EXPECT_FALSE(LQ::readDirectories(jpg, list, true));
    EXPECT_EQ(list.size(), 3u);

    list.clear();
    LQ::readImages(root, list, false);
    EXPECT_EQ(list, std::vector<std::string>{jpg});
    list.clear();
    LQ::readImages(root, list, true);
    EXPECT_EQ(sorted(list), sorted({jpg, root + "/sub/c.png"}));
    list.clear();
    LQ::readVideos(root, list, true);
    EXPECT_EQ(list, std::vector<std::string>{root + "/sub/deep/d.MOV"});
    list.clear();
    LQ::readFiles(jpg, list, ".jpg", false);  // a file path stands for itself
    LQ::readFiles(jpg, list, ".png", false);
    LQ::readFiles(root + "/none.jpg", list, ".jpg", false);
    LQ::readFiles(root, list, std::vector<std::string>{".txt", ".png"}, false);
    EXPECT_EQ(list, (std::vector<std::string>{jpg, root + "/b.txt"}));
}

TEST(StringUtils, SplitReplaceTrimAndSort) {
    EXPECT_EQ(LQ::split(",a,,bc,", ','), (std::vector<std::string>{"a", "bc"}));
    EXPECT_TRUE(LQ::split(",,,", ',').empty());
    EXPECT_EQ(LQ::replaceChar("a.b.c", '.', '/'), "a/b/c");
    EXPECT_EQ(LQ::replaceString("xaXbXX", "X", ""), "xab");
    EXPECT_EQ(LQ::replaceString("a-a", "a", "aa"), "aa-aa");  // no repeat inside a replacement
    EXPECT_EQ(LQ::replaceString("aaa", "aa", "b"), "ba");
    const FailedCheck empty = catchCheck([] { LQ::replaceString("abc", "", "x"); });
    EXPECT_EQ(empty.expression, "!from.empty()");
    EXPECT_EQ(empty.tail, "replace from empty sting");
    EXPECT_EQ(LQ::toLowerCase("AbC-1\xC4"), "abc-1\xC4");
    EXPECT_EQ(LQ::countChars("a\"b\"\"", '"'), 3);

    const struct {
        std::string text, characters, result;
    } trims[] = {
        {" \t\"x y\" \n", " \t\n", "x y"},
        {"   ", " ", "   "},  // only characters of the set: unchanged
        {" \"\" ", " ", ""},
        {"\"", " ", "\""},
        {"\"a\" b", " ", "\"a\" b"},
        {"--a--", "-", "a"},
    };
    for (const auto& t : trims) {
        std::string text = t.text;
        LQ::trim(text, t.characters);
        EXPECT_EQ(text, t.result) << t.text;
    }

    std::vector<std::string> names{"10", "9", "b", "a", "100", "ab"};
    LQ::numericSort(names);
    EXPECT_EQ(names, (std::vector<std::string>{"9", "a", "b", "10", "ab", "100"}));

    EXPECT_EQ(LQ::toBits(5), "00000101");
    EXPECT_EQ(LQ::toBits(256), "00000000 00000000 00000001 00000000");
    EXPECT_EQ(LQ::toBits(0x80000001u), "10000000 00000000 00000000 00000001");
}

TEST(StringUtils, AngleUnits) {
    EXPECT_EQ(LQ::degreeToRadian(-90.f), LQ::degreeToRadian(270.f));
    EXPECT_FLOAT_EQ(LQ::degreeToRadian(180.f), 3.1415927f);
    EXPECT_NEAR(LQ::radianToDegree(-1.5707964f), 270.f, 1e-4f);
    EXPECT_NEAR(LQ::radianToDegree(-0.5f), 331.35211f, 1e-3f);  // 360 - 28.64789
}
