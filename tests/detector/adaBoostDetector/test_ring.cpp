#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>
#include <iterator>
#include <sstream>

#include "ClassifierRing.h"
#include "GestureRings.h"
#include "LogCapture.h"
#include "PatternDetector.h"
#include "RandomRing.h"

using LQ::BaseSize;
using LQ::Side;

// the ring the build wrote as source and compiled into this test
extern "C" ClassifierRing* test_ring_seed7();
LQ::SharedPtr<BaseDetector> test_ring_seed7(const PatternDetector::Parameters& parameters,
                                            const LQ::AngleRange& angleRange);
LQ::SharedPtr<BaseDetector> test_ring_seed7(const PatternDetector::Parameters& parameters);

namespace {

std::string readText(const std::string& path) {
    std::ifstream file(path.c_str(), std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
}

void writeText(const std::string& path, const std::string& text) {
    std::ofstream(path.c_str(), std::ios::binary) << text;
}

std::string scratchDirectory(const std::string& name) {
    const std::string path = ::testing::TempDir() + "tactus_" + name + "_" + std::to_string(getpid());
    mkdir(path.c_str(), 0755);
    return path;
}

// a cascade with no stages, for angles and sides only
CascadedClassifier* bareCascade(int angle, bool symmetric) {
    CascadedClassifier* cascade = new CascadedClassifier();
    cascade->setMonoSize(BaseSize<int>(20, 30));
    cascade->setAngle(angle);
    cascade->setSymmetry(symmetric);
    return cascade;
}

std::vector<std::pair<int, Side::Value>> anglesAndSides(const ClassifierRing& ring) {
    std::vector<std::pair<int, Side::Value>> result;
    for (const ClassifierProperties& p : ring.getPossibilities())
        result.emplace_back(p.getAngle(), p.getSide());
    return result;
}

std::vector<std::pair<int, Side::Value>> offered(int angle, bool symmetric) {
    std::unique_ptr<CascadedClassifier> cascade(bareCascade(angle, symmetric));
    return anglesAndSides(ClassifierRing({cascade.get()}));
}

// A ring file of one 8 x 8 cascade: a census test at (x, y) and a HOG test of the given sector.
std::string oneStageRing(int x, int y, int sector, int stageCount = 1) {
    std::ostringstream text;
    std::string table;
    for (int i = 0; i < 256; ++i) table += "1 ";
    text << "hand\n1\n8 8\n8 8\nc\n0\n" << stageCount << "\n0\n";
    text << "1 0 1\n5 0\n";
    text << x << ' ' << y << ' ' << table << '\n';
    text << "1 1 6 6\t2 2 4 4\t" << sector << ' ' << table << "\n\n";
    for (int k = 0; k < 1000; ++k) text << "0 ";
    text << "\nconfig\n";
    return text.str();
}

}  // namespace

// Which (angle, side) pairs a ring offers follows from its base set alone.
TEST(ClassifierRing, PossibilitiesOfAngleAndSide) {
    const Side::Value R = Side::RIGHT, L = Side::LEFT, B = Side::BOTH;
    EXPECT_EQ(offered(0, false), (std::vector<std::pair<int, Side::Value>>{
                                     {0, R}, {0, L}, {90, R}, {-90, L}, {-180, R}, {-180, L}, {-90, R}, {90, L}}));
    EXPECT_EQ(offered(0, true), (std::vector<std::pair<int, Side::Value>>{{0, B}, {90, B}, {-180, B}, {-90, B}}));
    // the mirror of a symmetric 30-degree cascade is a -30-degree one, which no turn reaches
    EXPECT_EQ(offered(30, true).size(), 8u);

    std::unique_ptr<CascadedClassifier> minus30(bareCascade(-30, false));
    ClassifierRing ring({minus30.get()});
    EXPECT_EQ(anglesAndSides(ring),
              (std::vector<std::pair<int, Side::Value>>{
                  {-30, R}, {30, L}, {60, R}, {-60, L}, {150, R}, {-150, L}, {-120, R}, {120, L}}));
    ring.setAngleRange(LQ::AngleRange(-30, 30));
    ring.generatePossibilities();
    EXPECT_EQ(anglesAndSides(ring), (std::vector<std::pair<int, Side::Value>>{{-30, R}, {30, L}}));
    EXPECT_FALSE(ring.isSymmetric());
    std::unique_ptr<CascadedClassifier> symmetric(bareCascade(0, true));
    EXPECT_TRUE(ClassifierRing({symmetric.get()}).isSymmetric());
}

// Variants are made once, from the cheapest source, and then served as they are.
TEST(ClassifierRing, VariantsAreMadeOnceAndStay) {
    RandomRing made = makeRandomRing(3, "hand");
    ClassifierRing& ring = *made.ring;
    CascadedClassifier* upright = made.cascades[1].get();  // RIGHT at 0
    ASSERT_EQ(ring.getNumClassifiers(), 2u);

    EXPECT_EQ(ring.getClassifiers(LQ::AngleRange(0), Side::RIGHT), std::vector<CascadedClassifier*>{upright});
    EXPECT_EQ(ring.getAllClassifiers().size(), 2u);

    // one mirror and one quarter turn away
    ClassifierProperties leftAt90 = *upright;
    leftAt90.flip();
    leftAt90.rotate();
    EXPECT_EQ(upright->transformCost(leftAt90).cost(), 2);
    EXPECT_FALSE(upright->transformCost(*upright).possible);

    const std::vector<CascadedClassifier*> left = ring.getClassifiers(LQ::AngleRange(90), Side::LEFT);
    ASSERT_EQ(left.size(), 1u);
    CascadedClassifier expected(*upright);
    expected.flipVertically();
    expected.rotate();
    EXPECT_TRUE(*left[0] == expected);
    EXPECT_EQ(ring.getAllClassifiers().size(), 3u);
    EXPECT_EQ(ring.getClassifiers(LQ::AngleRange(90), Side::LEFT), left);

    // everything: the existing three first, and earlier pointers still good
    const std::vector<CascadedClassifier*> all = ring.getClassifiers(LQ::AngleRange(), Side::BOTH);
    ASSERT_EQ(all.size(), 16u);
    EXPECT_EQ(std::count(all.begin(), all.begin() + 3, left[0]), 1);
    EXPECT_TRUE(*left[0] == expected);
    // each possibility (name, angle, side, sizes) exactly once
    for (const ClassifierProperties& p : ring.getPossibilities())
        EXPECT_EQ(std::count_if(all.begin(), all.end(),
                                [&](CascadedClassifier* c) { return static_cast<const ClassifierProperties&>(*c) == p; }),
                  1)
            << p;
    // a variant turned back and mirrored back is its source again
    CascadedClassifier back(*left[0]);
    for (int k = 0; k < 3; ++k) back.rotate();
    back.flipVertically();
    EXPECT_TRUE(back == *upright);

    const int last0 = upright->stages().back().getThreshold();
    ring.setLastCascadeThreshold(0x7fffffff);
    EXPECT_EQ(upright->stages().back().getThreshold(), last0);
    const int first0 = upright->stages().front().getThreshold();
    ring.setLastCascadeThreshold(-7);
    for (const auto& cascade : ring.getAllClassifiers())
        EXPECT_EQ(cascade->stages().back().getThreshold(), -7);
    EXPECT_EQ(upright->stages().front().getThreshold(), first0);
}

// Text round trip of a ring; config and log follow the file's lines.
TEST(RingFile, RoundTripConfigAndLog) {
    const std::string dir = scratchDirectory("ringfile");
    RandomRing made = makeRandomRing(5, "hand_ring");
    made.ring->setLog("log\nfirst line\nsecond line\n");
    const std::string path = dir + "/hand.ring";
    ASSERT_TRUE(made.ring->save(path));

    ClassifierRing loaded(path);
    EXPECT_TRUE(loaded == *made.ring);
    EXPECT_EQ(loaded.getConfig().at("shape"), "RandomShape");
    EXPECT_EQ(loaded.getLog(), "first line\nsecond line\n");
    EXPECT_EQ(anglesAndSides(loaded), anglesAndSides(*made.ring));

    const std::string text = readText(path);
    const size_t config = text.find("config\n");
    ASSERT_NE(config, std::string::npos);
    writeText(path, text.substr(0, config) + "config\nflag\nkey=a=b\nlog\nx y\n");
    ASSERT_TRUE(loaded.load(path));
    EXPECT_EQ(loaded.getConfig(), (mapStringString{{"flag", "flag"}, {"key", "a=b"}}));
    EXPECT_EQ(loaded.getLog(), "x y\n");
    writeText(path, text.substr(0, config));
    ASSERT_TRUE(loaded.load(path));
    EXPECT_TRUE(loaded.getConfig().empty());
    EXPECT_TRUE(loaded.getLog().empty());
    EXPECT_EQ(loaded.getNumClassifiers(), 2u);

    EXPECT_FALSE(made.ring->save(dir + "/no/such/dir.ring"));
}

// Corrupt files end in a failed check or false, never a crash or a huge allocation.
TEST(RingFile, BadFilesFailCleanly) {
    const std::string dir = scratchDirectory("badring");
    ClassifierRing ring;
    const FailedCheck missing = catchCheck([&] { ring.load(dir + "/none.ring"); });
    EXPECT_EQ(missing.expression, "file");
    EXPECT_EQ(missing.tail, "cannot open file '" + dir + "/none.ring'");

    writeText(dir + "/ring.txt", oneStageRing(1, 1, 2));
    const FailedCheck extension = catchCheck([&] { ring.load(dir + "/ring.txt"); });
    EXPECT_EQ(extension.expression, "LQ::getFileExtention(path) == \".ring\"");
    EXPECT_EQ(extension.tail, "only ring files supported");

    const std::string path = dir + "/bad.ring";
    writeText(path, oneStageRing(1, 1, 2));
    EXPECT_TRUE(ring.load(path));
    // census point outside the window, too many stages, too many cascades
    for (const std::string& bad : {oneStageRing(8, 1, 2), oneStageRing(1, 1, 2, 20000), std::string("hand\n99999999\n")}) {
        writeText(path, bad);
        EXPECT_FALSE(ring.load(path)) << bad.substr(0, 20);
    }
    EXPECT_EQ(ring.getNumClassifiers(), 0u);
    writeText(path, oneStageRing(1, 1, 9));
    const FailedCheck sector = catchCheck([&] { ring.load(path); });
    EXPECT_EQ(sector.expression,
              "hogClassifier.getSector() < static_cast<LQ::uchar>(WeakClassifierHog::NUM_SECTORS)");

    RandomRing made = makeRandomRing(11, "hand");
    ASSERT_TRUE(made.ring->save(path));
    const std::string text = readText(path);
    const size_t cascades = text.find("config\n");
    for (int k = 1; k < 12; ++k) {
        writeText(path, text.substr(0, cascades * k / 12));
        EXPECT_FALSE(ring.load(path)) << k;
    }
}

// Generated source builds the same ring without copying its tables; its scanner functions
// keep one detector per distinct arguments.
TEST(GeneratedRing, BuildsTheSameRingWithoutCopies) {
    ClassifierRing* generated = test_ring_seed7();
    ASSERT_NE(generated, nullptr);
    RandomRing made = makeRandomRing(7, "test_ring_seed7");
    EXPECT_TRUE(*generated == *made.ring);
    EXPECT_TRUE(*generated == ClassifierRing(std::string(TACTUS_TEST_RING) + ".ring"));
    EXPECT_EQ(anglesAndSides(*generated), anglesAndSides(*made.ring));
    EXPECT_TRUE(generated->getLog().empty());
    for (const auto& cascade : generated->getBaseClassifiers())
        for (const StrongClassifier& stage : cascade->stages()) {
            for (const WeakClassifierRmct& c : stage.rmctClassifiers()) EXPECT_FALSE(c.owner.isOwning());
            for (const WeakClassifierHaar& c : stage.haarClassifiers()) EXPECT_FALSE(c.owner.isOwning());
            for (const WeakClassifierHog& c : stage.hogClassifiers()) EXPECT_FALSE(c.owner.isOwning());
        }
    EXPECT_EQ(test_ring_seed7(), generated);
    EXPECT_EQ(generated->getAllClassifiers().size(), 2u);

    const PatternDetector::Parameters coarse(2, 1, 0.1f, LQ::BaseRange<float>(20, 200));
    const PatternDetector::Parameters fine(1, 1, 0.1f, LQ::BaseRange<float>(20, 200));
    LQ::SharedPtr<BaseDetector> a = test_ring_seed7(coarse, LQ::AngleRange(-90, 90));
    EXPECT_TRUE(a == test_ring_seed7(coarse, LQ::AngleRange(-90, 90)));
    EXPECT_FALSE(a == test_ring_seed7(fine, LQ::AngleRange(-90, 90)));
    LQ::SharedPtr<BaseDetector> narrow = test_ring_seed7(coarse);
    EXPECT_FALSE(a == narrow);
    const PatternDetector& scanner = static_cast<const PatternDetector&>(*narrow);
    EXPECT_EQ(scanner.ring, generated);
    EXPECT_EQ(scanner.angleRange, LQ::AngleRange(-30, 30));
    EXPECT_EQ(scanner.side, Side::BOTH);
    EXPECT_EQ(scanner.parameters.step, 2);

    const std::string source = readText(std::string(TACTUS_TEST_RING) + ".cpp");
    EXPECT_EQ(source.rfind("/**\n * @file test_ring_seed7.h\n", 0), 0u);
    EXPECT_NE(source.find("    DLL_DECLSPEC ClassifierRing* test_ring_seed7();\n"), std::string::npos);
    // the first stage has no Haar rows and still has its loop
    EXPECT_NE(source.find("        for(; j < set_weak_classifiers_rmct_n_test_ring_seed7_r0[0] + "
                          "set_weak_classifiers_haar_n_test_ring_seed7_r0[0]; j++)\n"),
              std::string::npos);
    EXPECT_NE(source.find("    short set_weak_classifiers_haar_n_test_ring_seed7_r1[4] = {0, 2, 0, 3, };\n"),
              std::string::npos);

    // the stem is the file name up to its last dot, with or without a directory
    const std::string dir = scratchDirectory("stem");
    ASSERT_TRUE(made.ring->saveHeader(dir + "/ring.v2.cpp"));
    EXPECT_EQ(readText(dir + "/ring.v2.cpp").rfind("/**\n * @file ring.v2.h\n", 0), 0u);
    char previous[4096];
    ASSERT_NE(getcwd(previous, sizeof previous), nullptr);
    ASSERT_EQ(chdir(dir.c_str()), 0);
    const bool written = made.ring->saveHeader("plain.cpp");
    ASSERT_EQ(chdir(previous), 0);
    ASSERT_TRUE(written);
    EXPECT_NE(readText(dir + "/plain.cpp").find("ClassifierRing* plain()\n{\n"), std::string::npos);
    EXPECT_FALSE(made.ring->saveHeader(dir + "/no/such/dir.cpp"));
}

// A named ring prefers a file in the ring directory, fails a clear check on a file without
// data (or a missing one when nothing is compiled in), and is built once. Nothing else in
// this process asks for the heart ring.
TEST(GestureRings, MissingDataIsACheckThenTheRingStays) {
    const std::string name = "ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26";
    ClassifierRing* (*function)() = &ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26;
    const std::string dir = scratchDirectory("gesture_rings");
    const std::string path = dir + "/" + name + ".ring";
    setRingDirectory(dir);
    if (!hasCompiledRing(name)) {
        const FailedCheck missing = catchCheck([function] { function(); });
        EXPECT_EQ(missing.expression, "file");
        EXPECT_EQ(missing.tail, "cannot open file '" + path + "'");
    }

    writeText(path, "fist\n0\nconfig\n");
    const FailedCheck empty = catchCheck([function] { function(); });
    EXPECT_EQ(empty.tail, "ring " + name + " has no data in '" + path + "'");

    RandomRing made = makeRandomRing(13, "fist");
    ASSERT_TRUE(made.ring->save(path));
    ClassifierRing* ring = function();
    EXPECT_TRUE(*ring == *made.ring);
    unlink(path.c_str());
    EXPECT_EQ(function(), ring);
    EXPECT_EQ(ring->getAllClassifiers().size(), 2u);
    setRingDirectory("");
}
