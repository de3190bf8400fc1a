#pragma once
// The concrete engine of the library: it declares the engine's options, builds on the
// first frame the image nodes, the networks and the chain of the one gesture that "--mode"
// names, and on every frame turns the image upright by the device's orientation, runs the
// chain and carries the results back into the camera's coordinates.

#include <map>
#include <string>

#include "LQ_BaseDetector.h"
#include "LQ_ImageData.h"
#include "LQ_ImagePyramidData.h"
#include "LQ_Rect.h"
#include "LQ_Size.h"
#include "LQ_ViDetectorInterface.h"
#include "NnDetector.h"

class VI_MultiEngines : public LQ::ViDetectorInterface {
public:
    VI_MultiEngines();
    ~VI_MultiEngines() override;

    void initWithImages(const std::string& parameters, const std::map<std::string, LQ::Image>& images) override;
    void nnInit(const std::string& path);
    void initDetector();
    void setAngle();
    void detect() override;

    void computeHeartMiddle();
    void rotateResults(int angle);
    void flipResults() override;
    void scaleResults(float scale);

    int angle() const { return angle_; }
    float scale() const { return scale_; }
    const std::string& mode() const { return mode_; }
    const LQ::SharedPtr<LQ::BaseDetector>& detector() const { return detector_; }
    const LQ::SharedPtr<LQ::ImageData>& rotated() const { return rotated_; }

private:
    LQ::SharedPtr<LQ::ImageData> rotated_;
    LQ::SharedPtr<LQ::ImagePyramidData> pyramid_;
    std::string mode_;
    LQ::SharedPtr<LQ::BaseDetector> detector_;
    LQ::SharedPtr<LQ::ImageData> mono_;
    LQ::SharedPtr<LQ::ImageData> source_;
    // rotated_ reads the turn through a pointer to this member
    int angle_ = 0;
    bool isFlip_ = true;
    float scale_ = 1.0f;
    bool nnLoaded_ = false;
    NnDetector thumbUpVerifier_;
    NnDetector heartVerifier_;
    NnDetector victoryVerifier_;
    NnDetector pointerVerifier_;
    NnDetector pointerHandSide_;
    NnDetector fistVerifier_;
};

// The rectangle turned by quarter turns inside an image of the given size; its corner
// lands on a whole number and its size stays exact.
template <class T>
LQ::BaseRect<T> rotatePi4(const LQ::BaseRect<T>& rect, const LQ::BaseSize<int>& size, int turns) {
    const T w = rect.right - rect.left;
    const T h = rect.bottom - rect.top;
    const T W = static_cast<T>(size.width);
    const T H = static_cast<T>(size.height);
    T left = rect.left, top = rect.top, right = rect.right, bottom = rect.bottom;
    switch (turns % 4) {
        case 1:
            left = static_cast<T>(static_cast<int>(rect.top));
            top = static_cast<T>(static_cast<int>(W - rect.right - 1));
            right = left + h;
            bottom = top + w;
            break;
        case 2:
            left = static_cast<T>(static_cast<int>(W - rect.right - 1));
            top = static_cast<T>(static_cast<int>(H - rect.bottom - 1));
            right = left + w;
            bottom = top + h;
            break;
        case 3:
            left = static_cast<T>(static_cast<int>(H - rect.bottom - 1));
            top = static_cast<T>(static_cast<int>(rect.left));
            right = left + h;
            bottom = top + w;
            break;
        default:
            break;
    }
    return LQ::BaseRect<T>(left, top, right, bottom);
}
