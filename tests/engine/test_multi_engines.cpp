// The engine's pieces from inside: results carried back into camera coordinates, the
// turn it takes from the host, the minimum widths, and the palm rejector.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "AdaBoostDetector.h"
#include "GestureEngines.h"
#include "GestureRings.h"
#include "GlyphModels.h"
#include "LQ_ArchiveI.h"
#include "LQ_ColorModeData.h"
#include "LQ_States.h"
#include "PalmVerifiers.h"
#include "VI_MultiEngines.h"

using LQ::BasePoint;
using LQ::BaseRect;
using LQ::BaseSize;
using LQ::SharedPtr;

namespace {

const std::string& modelDirectory() {
    static std::string directory;
    if (directory.empty()) {
        directory = ::testing::TempDir() + "tactus_engine_models_" + std::to_string(getpid());
        mkdir(directory.c_str(), 0700);
        glyphModels::write(directory);
    }
    return directory;
}

LQ::Image grey(int width, int height) {
    LQ::Image image(BaseSize<int>(width, height), LQ::COLOR_MODE_BGR);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            for (int c = 0; c < 3; ++c) image.pixel(x, y)[c] = 90;
    return image;
}

// an engine that has seen one frame of the given size
struct Engine {
    VI_MultiEngines engine;
    explicit Engine(int width, int height = 360, const char* mode = "fist", const char* isFlip = "true",
                    const char* orientation = "0") {
        engine.setParameter("mode", mode);
        engine.setParameter("nn-path", modelDirectory().c_str());
        engine.setParameter("is-flip", isFlip);
        engine.init();
        frame(width, height, orientation);
    }
    void frame(int width, int height, const char* orientation) {
        LQ::ViFrameParameters parameters;
        parameters.images["bgr"] = grey(width, height);
        if (orientation) parameters.parameters["orientation"] = orientation;
        engine.processFrame(parameters);
    }
};

LQ::ViResult& result() {
    LQ::ViResult& r = LQ::ViResultState::viResult;
    r.reset();
    return r;
}

void addHeart(LQ::ViResult& r, float angle, const char* side) {
    r.rects.push_back(BaseRect<float>(100, 100, 200, 300));
    r.floats.push_back(angle);
    r.parameters.emplace_back();
    if (side) r.parameters.back()["side"] = side;
}

float minWidthOf(const Engine& e) {
    const VI_MultiEngines& engine = e.engine;
    const MultiEngine& chain = dynamic_cast<const MultiEngine&>(*engine.detector());
    AdaBoostDetector& trigger = dynamic_cast<AdaBoostDetector&>(*chain.parameters().triggerDetector);
    const auto& setter = dynamic_cast<const LQ::DetectRegionSetter&>(*trigger.parameters().regionDetector);
    return setter.regions()[0].widthRange.lower;
}

}  // namespace

// Where the palm verifiers come from: with no network file in the directory, the trained
// tables compiled in, equal to the committed model files; with a file, the file. Each case
// runs in a child process, since a verifier is made once per process; the test comes first,
// before the engines below make them in this one.
TEST(MultiEngines, CompiledPalmVerifiersUnlessAFileIsThere) {
    const auto inChild = [](const std::string& directory, const std::string& expectedFrom) {
        const pid_t child = fork();
        if (child == 0) {
            setNetworkDirectory(directory);
            bool same = true;
            for (const std::string name : {"palm_verifier__iter_250000", "palm_verifier_iter_140000"}) {
                NnDetector expected;
                LQ::ArchiveI::load(expectedFrom + "/" + name + ".nn", expected);
                const bool first = name == "palm_verifier__iter_250000";
                NnDetector filled;
                first ? palm_verifier__iter_250000(filled) : palm_verifier_iter_140000(filled);
                const SharedPtr<NNDetector> shared = first ? palm_verifier__iter_250000() : palm_verifier_iter_140000();
                same = same && filled == expected && *shared == expected;
            }
            _exit(same ? 0 : 1);
        }
        int status = -1;
        waitpid(child, &status, 0);
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    };
    const std::string empty = ::testing::TempDir() + "tactus_no_networks_" + std::to_string(getpid());
    mkdir(empty.c_str(), 0700);
    EXPECT_EQ(inChild(empty, TACTUS_NETWORK_MODELS), 0);
    EXPECT_EQ(inChild(modelDirectory(), modelDirectory()), 0);
    EXPECT_NE(inChild(modelDirectory(), TACTUS_NETWORK_MODELS), 0);
}

// The heart's point: a fixed offset from the centre by side and angle, turned by the angle.
TEST(MultiEngines, HeartMiddle) {
    Engine e(640);
    LQ::ViResult& r = result();
    addHeart(r, 0, "LEFT");
    addHeart(r, 0, "RIGHT");
    addHeart(r, 90, "RIGHT");
    addHeart(r, 0, nullptr);  // no side: not a left heart
    e.engine.computeHeartMiddle();
    ASSERT_EQ(r.points.size(), 4u);
    EXPECT_EQ(r.points[0], BasePoint<float>(117, 126));
    EXPECT_EQ(r.points[1], BasePoint<float>(183, 122));
    // offset (10, -90) turned by -90 degrees
    EXPECT_EQ(r.points[2], BasePoint<float>(60, 190));
    EXPECT_EQ(r.points[3], r.points[1]);
    EXPECT_EQ(r.parameters[3]["side"], "");

    r.floats.pop_back();
    EXPECT_ANY_THROW(e.engine.computeHeartMiddle());
    result();
    e.engine.computeHeartMiddle();
    EXPECT_TRUE(LQ::ViResultState::viResult.points.empty());
}

// Turning back, mirroring and scaling, on the sizes the engine's nodes have.
TEST(MultiEngines, ResultsBackInCameraCoordinates) {
    EXPECT_EQ(rotatePi4(BaseRect<float>(10, 20, 30, 60), BaseSize<int>(100, 200), 1), BaseRect<float>(20, 69, 60, 89));
    EXPECT_EQ(rotatePi4(BaseRect<float>(10.5f, 20, 30, 60), BaseSize<int>(100, 200), 4),
              BaseRect<float>(10.5f, 20, 30, 60));

    Engine portrait(640);  // orientation 0 turns a quarter: the upright image is 360 x 640
    ASSERT_EQ(portrait.engine.rotated()->size(), BaseSize<int>(360, 640));
    LQ::ViResult& r = result();
    r.points.push_back(BasePoint<float>(10, 20));
    r.points.push_back(BasePoint<float>(10.5f, 20.25f));
    portrait.engine.rotateResults(0);
    portrait.engine.rotateResults(360);
    EXPECT_EQ(r.points[1], BasePoint<float>(10.5f, 20.25f));
    portrait.engine.rotateResults(-90);
    EXPECT_EQ(r.points[0], BasePoint<float>(619, 10));
    EXPECT_EQ(r.points[1], BasePoint<float>(618, 10));  // 618.75, truncated

    Engine narrow(100, 60);
    LQ::ViResult& f = result();
    f.rects.push_back(BaseRect<float>(10, 20, 30, 40));
    f.points.push_back(BasePoint<float>(10, 20));
    narrow.engine.flipResults();
    EXPECT_EQ(f.rects[0], BaseRect<float>(69, 20, 89, 40));
    EXPECT_EQ(f.points[0], BasePoint<float>(89, 20));
    Engine back(100, 60, "fist", "false");
    back.engine.flipResults();
    EXPECT_EQ(f.rects[0], BaseRect<float>(69, 20, 89, 40));

    LQ::ViResult& s = result();
    s.rects.push_back(BaseRect<float>(1.5f, 2, 3, 4));
    back.engine.scaleResults(2);
    EXPECT_EQ(s.rects[0], BaseRect<float>(3, 4, 6, 8));
}

// The turn from the host's orientation, with a front and a back camera, the minimum
// widths that follow the frame's size, and the thumb-up's result box.
TEST(MultiEngines, TurnsWidthsAndResultBoxes) {
    // each orientation's turn on both cameras is pinned end to end in EngineClip
    Engine back(640, 360, "fist", "false", "90");
    EXPECT_EQ(back.engine.angle(), -180);
    back.frame(640, 360, "0");
    EXPECT_EQ(back.engine.angle(), -90);
    // no orientation data: a back camera flips the stored turn on every frame
    back.frame(640, 360, nullptr);
    EXPECT_EQ(back.engine.angle(), 90);
    back.frame(640, 360, nullptr);
    EXPECT_EQ(back.engine.angle(), -90);
    // 45 isn't a turn: the frame fails inside, the turn stays (450 as 90: see EngineClip)
    back.frame(640, 360, "45");
    EXPECT_EQ(back.engine.angle(), -90);

    EXPECT_EQ(minWidthOf(Engine(1280, 720)), 56);
    EXPECT_EQ(minWidthOf(Engine(640)), 28);
    EXPECT_EQ(minWidthOf(Engine(320, 180)), 14);
    EXPECT_EQ(minWidthOf(Engine(640, 360, "victory")), 42);
    EXPECT_EQ(minWidthOf(Engine(640, 360, "pointer")), 30);

    Engine thumb(640, 360, "thumbUp");
    const MultiEngine& chain = dynamic_cast<const MultiEngine&>(*thumb.engine.detector());
    const LQ::ObjectLocation object(BasePoint<float>(100, 100), LQ::BaseSize<float>(50, 50), 0, LQ::Side::RIGHT);
    const BaseRect<float> box = chain.parameters().resultLocation.getLocationState(object).getRect();
    EXPECT_FLOAT_EQ(box.right - box.left, 45);
    EXPECT_FLOAT_EQ(box.bottom - box.top, 85.5f);
    EXPECT_FLOAT_EQ((box.top + box.bottom) / 2, 95);
}

// The rejector refuses an object when an open palm stands where it is, gives the object
// back untouched when none does, and leaves an already refused object alone.
TEST(MultiEngines, PalmRejector) {
    modelDirectory();
    setRingDirectory(modelDirectory());
    setNetworkDirectory(modelDirectory());
    LQ::Image scene(BaseSize<int>(320, 240), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < 240; ++y)
        for (int x = 0; x < 320; ++x) scene.pixel(x, y)[0] = glyphs::kDark;
    glyphs::draw(glyphs::kFrame, scene, 40, 60, 2.f, glyphs::Pose{false, 0});  // a 48-pixel palm at (64, 84)
    SharedPtr<LQ::ImageData> image(new LQ::ImageData());
    image->set(scene);
    SharedPtr<LQ::ImagePyramidData> pyramid(new LQ::ImagePyramidData(image, 1));
    RejectorPalmDetector rejector(pyramid, image, LQ::RelativeLocation(2, BasePoint<float>(0, 0), 0, 0, 0),
                                  LQ::BaseRange<float>(0.76f, 2.3f));

    SharedPtr<LQ::StateAggregator> state = LQ::StateAggregator::newDetectorState();
    const LQ::ObjectLocation onPalm(BasePoint<float>(64, 84), LQ::BaseSize<float>(40, 40), 0, LQ::Side::RIGHT);
    state->get<LQ::LocationState>() = onPalm;
    rejector.detect(state);
    EXPECT_FALSE(static_cast<const LQ::ObjectLocation&>(state->get<LQ::LocationState>()).isSet());

    const LQ::ObjectLocation elsewhere(BasePoint<float>(230, 150), LQ::BaseSize<float>(40, 40), 10, LQ::Side::LEFT);
    state->get<LQ::LocationState>() = elsewhere;
    rejector.detect(state);
    EXPECT_EQ(static_cast<const LQ::ObjectLocation&>(state->get<LQ::LocationState>()), elsewhere);

    state->get<LQ::LocationState>().reset();
    rejector.detect(state);
    EXPECT_FALSE(static_cast<const LQ::ObjectLocation&>(state->get<LQ::LocationState>()).isSet());
}
