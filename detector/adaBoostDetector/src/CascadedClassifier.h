#pragma once
// A series of stages over a window of fixed size, and the integer scan of one pyramid
// layer. Most windows end in the first stage, which the scan evaluates for a row of windows
// at once; those that pass go on through the later stages in lists. Where many pass it, the
// census stages that follow are evaluated for the row at once too.

#include <istream>
#include <map>
#include <ostream>
#include <string>
#include <vector>

#include "AdaObject.h"
#include "ClassifierProperties.h"
#include "LQ_Image.h"
#include "StageKernels.h"
#include "StrongClassifier.h"

// The integral HOG of one rectangle of a layer, computed when the first window of any
// cascade at that layer reaches a HOG stage and shared by all of them. Block sums of a
// window read from it equal those of the window's own integral HOG, because the gradient
// of a pixel depends only on its neighbours and every block lies one pixel inside the
// window's HOG region.
struct LayerHog {
    void bind(const LQ::Image& layer, const LQ::BaseRect<int>& region) {
        mono = &layer;
        rect = region.intersect(layer.rect());
        computed = false;
        ownArea = 0;
    }
    const LQ::Image* mono = nullptr;
    LQ::BaseRect<int> rect;
    LQ::Image image;
    bool computed = false;
    double ownArea = 0;  // of the windows' own integral HOGs made so far instead
};

class CascadedClassifier : public ClassifierProperties {
public:
    CascadedClassifier() = default;
    // a copy carries the run-time state, re-pointed at its own stages
    CascadedClassifier(const CascadedClassifier& other) : ClassifierProperties(other) { *this = other; }
    CascadedClassifier& operator=(const CascadedClassifier& other);

    void addStrongClassifier(const StrongClassifier& stage) { strongClassifiers.push_back(stage); }

    void activate(int rmctStride, int monoStride, int integralStride, float scale,
                  const LQ::BaseSize<int>& monoSize);
    // Appends one object per window whose object lies in roi (layer coordinates) and that
    // passes every stage. integral has the base image's resolution, scale times the layer's.
    void addMatches(const LQ::Image& rmct, const LQ::Image& mono, const LQ::Image& integral,
                    std::vector<AdaObject>& objects, const LQ::BaseRect<int>& roi, float scale, int step);
    void addMatches(const LQ::Image& rmct, const LQ::Image& mono, const LQ::Image& integral,
                    std::vector<AdaObject>& objects, float scale, int step);
    // rect holds the first and the last window position, both inclusive
    void addMatchesStatic(const LQ::Image& rmct, const LQ::Image& mono, const LQ::Image& integralImage,
                          std::vector<AdaObject>& objects, const LQ::BaseRect<int>& rect, int bucket, int step);
    void addMatchesDynamic(const LQ::Image& rmct, const LQ::Image& mono, const LQ::Image& integralImage,
                           std::vector<AdaObject>& objects, const LQ::BaseRect<int>& rect, int bucket, int step);
    // one window from firstStage on; true when it passes every stage from there
    bool detect(const unsigned char* rmct, const unsigned char* mono, const unsigned int* integral,
                unsigned int firstStage, int& score);

    void calculateHogRoi();
    // a quarter turn, and the mirror image; both need window coordinates, so they come
    // before the first activation
    void rotate();
    void flipVertically();

    // the cascade record of a ring file
    void save(std::ostream& stream) const;
    bool load(std::istream& stream);
    // the tables and building code of the generated source
    void writeClassifier(std::ostream& stream, const std::string& prefix) const;

    void setName(const std::string& name);
    // also after activation: the scan's copy of the first threshold follows
    void setLastStageThreshold(int threshold);
    // with a shared layer HOG the scan reads from it instead of making one per window;
    // null goes back to one per window
    void setLayerHog(LayerHog* layerHog) { layerHog_ = layerHog; }
    // The share of a row's windows passing the first stage from which the next row takes
    // its census stages at once rather than in lists. Results don't depend on it; tests and
    // benchmarks set 0 or above 1 to force one way.
    void setDenseRowShare(double share) { denseRowShare_ = share; }
    // A layer's integral HOG is made once the windows reaching HOG cover this share of its
    // area with their own regions; fewer take their own. 0: always the layer's.
    void setLayerHogShare(double share) { layerHogShare_ = share; }
    const std::vector<StrongClassifier>& stages() const { return strongClassifiers; }
    std::vector<StrongClassifier>& stages() { return strongClassifiers; }
    const LQ::BaseRect<int>& getHogRoi() const { return hogRoi_; }
    int getFirstHogStage() const { return firstHogStage_; }
    // windows that reached the first HOG stage since construction: lets tests see that
    // the integral HOG is made only when needed
    long long hogComputations() const { return hogComputations_; }

    bool operator==(const CascadedClassifier& other) const {
        return ClassifierProperties::operator==(other) && baseSize_ == other.baseSize_ &&
               strongClassifiers == other.strongClassifiers;
    }

    std::vector<StrongClassifier> strongClassifiers;

private:
    void resetRunTimeState();
    void appendObject(std::vector<AdaObject>& objects, int x, int y, int score) const;
    // the stages from first on, with the integral HOG computed on reaching its first stage
    bool passesFrom(int first, const unsigned char* r, const unsigned char* m, const unsigned int* i, int x, int y,
                    int& score);
    // the first integral HOG sum for the window at (x, y) of the layer whose top-left mono pixel is m
    const unsigned int* windowHog(const unsigned char* m, int x, int y);
    void useHogRowLength(int rowLength);

    LQ::Image hogImage_;
    bool hogRoiComputed_ = false;
    LQ::BaseRect<int> hogRoi_;
    int monoStride_ = 0;
    int firstHogStage_ = 0x7fffffff;
    bool firstStageFlag_ = false;
    int startStage_ = 0;
    int firstThreshold_ = INT_MIN;
    std::map<int, std::vector<int>> shiftTables_;
    const StrongClassifier* firstStage_ = nullptr;
    // the ring's name shared by every cascade of that name, so hits compare names by pointer
    const char* sharedName_ = "";
    long long hogComputations_ = 0;
    LayerHog* layerHog_ = nullptr;
    double denseRowShare_ = denseCensusShare();
    double layerHogShare_ = 1.0;
    // row length the HOG offsets are made for at present
    int hogRowLength_ = 0;
    // a window still in the race, at its position in the layer, and its last stage sum
    struct Survivor {
        int x, y, score;
    };
    // the scan's working lists, sized by the largest layer so far: the first stage's
    // survivors of one row, and those of the whole layer in scan order
    std::vector<int> passed_, passedScores_;
    std::vector<Survivor> survivors_;
};
