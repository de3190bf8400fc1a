#include "VI_MultiEngines.h"

#include <cmath>

#include "GestureEngines.h"
#include "GestureRings.h"
#include "LQ_ArchiveI.h"
#include "LQ_ColorModeData.h"
#include "LQ_Geometry.h"
#include "LQ_ImageRotatePi4Data.h"
#include "LQ_ImageZoomData.h"
#include "LQ_ObjectLocation.h"
#include "LQ_StringUtils.h"
#include "PalmVerifiers.h"
#include "VI_Tactus_Interface.h"

using LQ::SharedPtr;

VI_MultiEngines::VI_MultiEngines() {
    commandLineParser_.add("", "--nn-path", "/storage/emulated/0/nn/", false, LQ::ValueType::STRING,
                           "Path to nn files on target device.");
    commandLineParser_.add("", "--mode", "", true, LQ::ValueType::STRING,
                           "detection mode, space separated list of the following: palm, palmRotation, fist, "
                           "thumbUp, victory");
    commandLineParser_.add("", "--is-flip", "true", false, LQ::ValueType::BOOL,
                           "Parameter for recognize front or back camera is using");
    viEngineInfo_.parameters["zoom-twice"] = "1";
    viEngineInfo_.imageNames.push_back("bgr");
    LQ::ImageZoomData::setResizeAlgorithm(static_cast<LQ::ResizeAlgorithm::Value>(1));
}

VI_MultiEngines::~VI_MultiEngines() {
    // the chain's objects live in the engine's state; drop them before the chain goes
    if (stateAggregator_) stateAggregator_->reset();
}

void VI_MultiEngines::initWithImages(const std::string& parameters, const std::map<std::string, LQ::Image>& images) {
    LQ_LOG_FORCED(LQ::LOG_LEVEL_INFO, "parameters" << " = " << parameters);
    commandLineParser_.parse(parameters);
    initImages(images);
    mode_ = commandLineParser_.getString("--mode");
    source_ = imageDatas_["bgr"];
    rotated_ = SharedPtr<LQ::ImageData>(new LQ::ImageRotatePi4Data(source_, &angle_));
    const std::string path = commandLineParser_.getString("--nn-path") + "/";
    // the ring tables and palm verifiers are read beside the networks until they are compiled in
    setRingDirectory(path);
    setNetworkDirectory(path);
    if (!nnLoaded_) nnInit(path);
    mono_ = SharedPtr<LQ::ImageData>(new LQ::ColorModeData(rotated_, LQ::COLOR_MODE_MONO));
    pyramid_ = SharedPtr<LQ::ImagePyramidData>(new LQ::ImagePyramidData(mono_, 1));
    isFlip_ = commandLineParser_.getBool("--is-flip");
    scale_ = source_->size().width / 640.0f;
    initDetector();
}

void VI_MultiEngines::nnInit(const std::string& path) {
    LQ::ArchiveI::load(path + "thumbUp_verifier_iter_55000.nn", thumbUpVerifier_);
    LQ::ArchiveI::load(path + "heart_verifier_vent_iter_60000.nn", heartVerifier_);
    LQ::ArchiveI::load(path + "victory_verifier_face_pos_color_2017_12_14__iter_39000.nn", victoryVerifier_);
    LQ::ArchiveI::load(path + "pointer_verifier__iter_18000.nn", pointerVerifier_);
    LQ::ArchiveI::load(path + "pointer_hand_side__iter_7500.nn", pointerHandSide_);
    LQ::ArchiveI::load(path + "fist_verifier_iter_135000.nn", fistVerifier_);
    nnLoaded_ = true;
    thumbUpVerifier_.setInputColorMode(LQ::COLOR_MODE_MONO);
    heartVerifier_.setInputColorMode(LQ::COLOR_MODE_MONO);
    victoryVerifier_.setInputColorMode(LQ::COLOR_MODE_BGR);
    pointerVerifier_.setInputColorMode(LQ::COLOR_MODE_MONO);
    pointerHandSide_.setInputColorMode(LQ::COLOR_MODE_MONO);
}

void VI_MultiEngines::initDetector() {
    LQ_LOG_FORCED(LQ::LOG_LEVEL_INFO, "Init detectors\n");
    auto minWidth = [this](int factor) { return static_cast<int>(scale_ * factor); };
    if (mode_ == "heart") {
        // the heart's chain carries it between hits with the correlation tracker
        LQ_ASSERT_MSG(false, "mode heart needs the correlation tracker, which this build doesn't have yet");
    } else if (mode_ == "thumbUp") {
        detector_ = SharedPtr<LQ::BaseDetector>(thumbUpEngine(mono_, pyramid_, minWidth(28), 0, thumbUpVerifier_));
    } else if (mode_ == "victory") {
        detector_ =
            SharedPtr<LQ::BaseDetector>(victoryPalmEngine(rotated_, pyramid_, minWidth(42), 0, victoryVerifier_));
    } else if (mode_ == "fist") {
        detector_ = SharedPtr<LQ::BaseDetector>(fistEngine(mono_, pyramid_, minWidth(28), 0, fistVerifier_));
    } else if (mode_ == "pointer") {
        detector_ = SharedPtr<LQ::BaseDetector>(
            pointerEngine(mono_, pyramid_, minWidth(30), 0, pointerVerifier_, pointerHandSide_));
    } else {
        LQ_ASSERT_MSG(false, "Unknown mode = " << mode_ << " Possible modes: heart, thumbUp, victory, fist, pointer");
    }
}

void VI_MultiEngines::setAngle() {
    int a = angle_;
    const auto orientation = frameParameters_.find("orientation");
    if (orientation != frameParameters_.end()) {
        int o = LQ::fromStr<int>(orientation->second);
        LQ::normalizeAngle(o);
        if (o == 0)
            a = 90;
        else if (o == 90)
            a = -180;
        else if (o == -180)
            a = -90;
        else if (o == -90)
            a = 0;
        else
            LQ_ASSERT_MSG(false, "Unknown angle = " << o << ", possible angles: 0, 90, 180, 270");
    } else if (frameParameters_.count("accelx") && frameParameters_.count("accely") &&
               frameParameters_.count("accelz")) {
        const float x = LQ::fromStr<float>(frameParameters_["accelx"]);
        const float y = LQ::fromStr<float>(frameParameters_["accely"]);
        const float z = LQ::fromStr<float>(frameParameters_["accelz"]);
        const int deg = static_cast<int>(LQ::radianToDegree(LQ::getAngleFromAcceleration(x, y, z)));
        // the ranges leave 45 and 135 out; they go with the turn below them
        if (deg <= 45 || deg > 315)
            a = 0;
        else if (deg <= 135)
            a = 90;
        else if (deg <= 224)
            a = 180;
        else
            a = 270;
    } else {
        LQ_LOG_FORCED(LQ::LOG_LEVEL_INFO, "Use default angle " << angle_);
    }
    if (!isFlip_) a = -a;
    LQ::normalizeAngle(a);
    if (a != angle_) {
        angle_ = a;
        rotated_->get();
        initDetector();
    }
}

void VI_MultiEngines::detect() {
    setAngle();
    detector_->detect(stateAggregator_);
    if (mode_ == "heart") computeHeartMiddle();
    rotateResults(-angle_);
    flipResults();
    scaleResults(2.0f);
}

void VI_MultiEngines::computeHeartMiddle() {
    LQ::ViResult& result = stateAggregator_->get<LQ::ViResultState>().result();
    LQ_ASSERT_EQ(result.rects.size(), result.floats.size());
    LQ_ASSERT_EQ(result.rects.size(), result.parameters.size());
    for (size_t i = 0; i < result.rects.size(); ++i) {
        const float a = result.floats[i];
        const std::string& sideText = result.parameters[i]["side"];
        const LQ::Side::Value side = sideText.empty() ? LQ::Side::NONE : LQ::fromStr<LQ::Side::Value>(sideText);
        const LQ::BaseRect<float>& r = result.rects[i];
        const int left = static_cast<int>(r.left), top = static_cast<int>(r.top);
        const int right = static_cast<int>(r.right), bottom = static_cast<int>(r.bottom);
        const int W = right - left, H = bottom - top;
        const int cx = (left + right) / 2, cy = (top + bottom) / 2;
        double fx, fy;
        if (side == LQ::Side::LEFT) {
            if (a > -30.01f && a < -29)
                fx = 0.05, fy = 0.4;
            else if (std::fabs(a) < 0.5f)
                fx = 0.33, fy = 0.37;
            else
                fx = 0.1, fy = 0.45;
        } else {
            if (a > 29 && a < 30.01f)
                fx = -0.05, fy = 0.4;
            else if (std::fabs(a) < 0.5f)
                fx = -0.33, fy = 0.39;
            else
                fx = -0.1, fy = 0.45;
        }
        const LQ::BasePoint<float> offset(static_cast<float>(-static_cast<int>(W * fx)),
                                          static_cast<float>(-static_cast<int>(H * fy)));
        const LQ::BasePoint<float> turned = LQ::rotate(offset, LQ::degreeToRadian(-a));
        result.points.push_back(LQ::BasePoint<float>(std::trunc(turned.x + cx), std::trunc(turned.y + cy)));
    }
}

void VI_MultiEngines::rotateResults(int angle) {
    LQ::ViResult& result = stateAggregator_->get<LQ::ViResultState>().result();
    const int t = (angle / 90 + 400) % 4;
    const LQ::BaseSize<int> size = rotated_->size();
    const float W = static_cast<float>(size.width), H = static_cast<float>(size.height);
    for (LQ::BasePoint<float>& p : result.points) {
        const float x = p.x, y = p.y;
        if (t == 1)
            p = LQ::BasePoint<float>(std::trunc(y), std::trunc(W - x - 1));
        else if (t == 2)
            p = LQ::BasePoint<float>(std::trunc(W - x - 1), std::trunc(H - y - 1));
        else if (t == 3)
            p = LQ::BasePoint<float>(std::trunc(H - y - 1), std::trunc(x));
    }
    for (LQ::BaseRect<float>& rect : result.rects) rect = rotatePi4(rect, size, t);
}

void VI_MultiEngines::flipResults() {
    if (!isFlip_) return;
    LQ::ViResult& result = stateAggregator_->get<LQ::ViResultState>().result();
    const float W = static_cast<float>(source_->size().width);
    for (LQ::BasePoint<float>& p : result.points) p.x = W - p.x - 1;
    for (LQ::BaseRect<float>& rect : result.rects) {
        const float left = W - rect.right - 1;
        rect = LQ::BaseRect<float>(left, rect.top, left + (rect.right - rect.left), rect.top + (rect.bottom - rect.top));
    }
}

void VI_MultiEngines::scaleResults(float scale) {
    LQ::ViResult& result = stateAggregator_->get<LQ::ViResultState>().result();
    for (LQ::BasePoint<float>& p : result.points) p = LQ::BasePoint<float>(p.x * scale, p.y * scale);
    for (LQ::BaseRect<float>& rect : result.rects)
        rect = LQ::BaseRect<float>(rect.left * scale, rect.top * scale, rect.right * scale, rect.bottom * scale);
}

LQ::ViInterface* getEngine() { return new VI_MultiEngines; }
