#include "VI_Tactus_Interface.h"

#include <sstream>

#include "LQ_Yuv420toBgr.h"

LQ::ViFrameParameters viFrameParameters;
LQ::ViResult viResult;
std::string possibleColorModes[LQ::COLOR_MODE_END];
bool zoomTwice = false;
bool swapRedBlue = false;

namespace {
LQ::ViInterface& engine() { return *ViInterfaceSingleton::get(); }

const char* colorModeName(LQ::ColorMode mode) {
    std::string& name = possibleColorModes[mode];
    if (name.empty()) name = LQ::toStr<LQ::ColorMode>(mode);
    return name.c_str();
}

// reads the engine's published flag if it is there; otherwise the flag stays
void readSetting(const LQ::ViEngineInfo& info, const char* key, bool& flag) {
    const auto found = info.parameters.find(key);
    if (found != info.parameters.end()) flag = LQ::fromStr<int>(found->second) != 0;
}
}  // namespace

void VI_Tactus_Init() {
    engine().init();
    const LQ::ViEngineInfo& info = engine().getEngineInfo();
    readSetting(info, "zoom-twice", zoomTwice);
    readSetting(info, "swap-red-blue", swapRedBlue);
}

void VI_Tactus_SetParameter(const char* name, const char* value) { engine().setParameter(name, value); }

void VI_Tactus_SetRoi(int a, int b, int c, int d) {
    std::ostringstream text;
    text << "Rect(" << a << ", " << b << ", " << c << ", " << d << ")";
    viFrameParameters.parameters["rect"] = text.str();
}

void VI_Tactus_SetFrame(unsigned char* frame, int width, int height, int i) {
    LQ_ASSERT_NOT_NULL(frame);
    LQ_ASSERT_GE(i, 0);
    LQ_ASSERT_LT(i, (int)ViInterfaceSingleton::get()->getEngineInfo().imageNames.size());
    const std::string name = engine().getEngineInfo().imageNames[i];
    const LQ::ColorMode mode = LQ::ViInterface::parseImageName(name);
    LQ::Image source;
    source.createRef(frame, LQ::BaseSize<int>(width, height), mode);
    // a new image every frame: the engine may still hold the previous one
    LQ::Image destination;
    LQ::yuv420toBgr(source, destination, true, false);
    viFrameParameters.images[name].createRef(destination);
}

void VI_Tactus_SetFrameParameter(const char* key, const char* value) {
    viFrameParameters.parameters.insert(std::make_pair(std::string(key), std::string(value)));
}

void VI_Tactus_ProcessFrame() {
    const LQ::ViResult& result = engine().processFrame(viFrameParameters);
    viResult.gestures = result.gestures;
    viResult.floats = result.floats;
    viResult.rects = result.rects;
    viResult.points = result.points;
    viResult.points3d = result.points3d;
    viResult.parameters = result.parameters;
    viResult.images = result.images;
    viFrameParameters.reset();
}

int VI_Tactus_GetGesture(const char*& gesture, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.gestures.size())) {
        gesture = "";
        return 0;
    }
    gesture = viResult.gestures[i].c_str();
    return 1;
}

int VI_Tactus_GetRect(float& left, float& top, float& right, float& bottom, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.rects.size())) {
        left = top = right = bottom = 0;
        return 0;
    }
    const LQ::BaseRect<float>& rect = viResult.rects[i];
    left = rect.left;
    top = rect.top;
    right = rect.right;
    bottom = rect.bottom;
    return 1;
}

int VI_Tactus_GetPoint(float& x, float& y, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.points.size())) {
        x = y = 0;
        return 0;
    }
    x = viResult.points[i].x;
    y = viResult.points[i].y;
    return 1;
}

int VI_Tactus_GetPoint3d(float& x, float& y, float& z, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.points3d.size())) {
        x = y = z = 0;
        return 0;
    }
    x = viResult.points3d[i].x;
    y = viResult.points3d[i].y;
    z = viResult.points3d[i].z;
    return 1;
}

int VI_Tactus_GetFloat(float& value, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.floats.size())) {
        value = 0;
        return 0;
    }
    value = viResult.floats[i];
    return 1;
}

int VI_Tactus_GetParameter(const char* name, const char*& value, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.parameters.size())) {
        value = nullptr;
        return 0;
    }
    // a missing key is created with an empty value, as operator[] does
    value = viResult.parameters[i][name].c_str();
    return 1;
}

int VI_Tactus_GetFrame(unsigned char*& data, int& width, int& height, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.images.size())) {
        data = nullptr;
        width = height = 0;
        return 0;
    }
    const LQ::Image& image = viResult.images[i];
    data = image.data();
    width = image.width();
    height = image.height();
    return 1;
}

void VI_Tactus_Reset() { engine().reset(); }

void VI_Tactus_Release() { engine().release(); }

const char* VI_Tactus_GetVersion() { return engine().getEngineInfo().version.c_str(); }

LQ::ViEngineInfo& VI_Tactus_GetEngineInfo_() { return engine().getEngineInfo(); }

const void* VI_Tactus_Request_(const char* name, const void* data) { return engine().request(std::string(name), data); }

int VI_Tactus_GetDebugImage_(const char*& name, unsigned char*& data, const char*& colorMode, int& width, int& height,
                             int& stripLength, int i) {
    LQ_ASSERT_GE(i, 0);
    const auto& images = LQ::DebugImages::debugImages_;
    if (i >= static_cast<int>(images.size())) {
        name = nullptr;
        data = nullptr;
        colorMode = nullptr;
        width = height = stripLength = 0;
        return 0;
    }
    const LQ::Image& image = images[i].second;
    name = images[i].first.c_str();
    data = image.data();
    colorMode = colorModeName(image.colorMode());
    width = image.width();
    height = image.height();
    stripLength = static_cast<int>(image.stripLength());
    return 1;
}

int VI_Tactus_GetFrameColorMode_(const char*& colorMode, int i) {
    LQ_ASSERT_GE(i, 0);
    if (i >= static_cast<int>(viResult.images.size())) {
        colorMode = nullptr;
        return 0;
    }
    colorMode = colorModeName(viResult.images[i].colorMode());
    return 1;
}
