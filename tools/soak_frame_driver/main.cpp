// Runs many frames through a frame driver whose detector makes and drops per-object state
// and asks the pyramid for widths that wander, as a tracker following a hand does, and
// prints the peak resident size along the way. Memory must stay flat.
//   soak_frame_driver [frames]      default 10000
#include <sys/resource.h>

#include <cstdio>
#include <cstdlib>
#include <deque>

#include "LQ_ImagePyramidData.h"
#include "LQ_States.h"
#include "LQ_ViDetectorInterface.h"

namespace {
long peakResidentKiB() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

class SoakEngine : public LQ::ViDetectorInterface {
public:
    void initWithImages(const std::string& parameters, const std::map<std::string, LQ::Image>& images) override {
        commandLineParser_.parse(parameters);
        initImages(images);
        pyramid_ = LQ::SharedPtr<LQ::ImagePyramidData>(new LQ::ImagePyramidData(imageDatas_["mono"], 2));
    }

    void detect() override {
        // a few objects appear each frame and live a few frames
        LQ::MultiState& objects = stateAggregator_->get<LQ::MultiState>();
        for (int i = 0; i < 3; ++i) {
            LQ::SharedPtr<LQ::StateAggregator> object = LQ::StateAggregator::newDetectorState();
            object->get<LQ::ParentSharedStateAggregator>() = stateAggregator_;
            object->get<LQ::LocationState>() =
                LQ::ObjectLocation(LQ::PointF(100.f + i, 80), LQ::SizeF(40, 40), 0, LQ::Side::RIGHT);
            object->get<LQ::VerificationHistoryState>().init(8);
            object->get<LQ::VerificationHistoryState>().add(true);
            object->get<LQ::ScoresState>().assign(16, 0.5f);
            objects.push_back(object);
        }
        while (objects.size() > 12) objects.erase(objects.begin());
        // a wandering width, as a tracker's search region does
        const int width = 40 + (frameNum_ * 7) % 200;
        const LQ::Image& layer = pyramid_->getByWidth(LQ::COLOR_MODE_RMCT, width)->get();
        checksum_ += layer.pixel(layer.width() / 2, layer.height() / 2)[0];
    }

    unsigned long checksum_ = 0;

private:
    LQ::SharedPtr<LQ::ImagePyramidData> pyramid_;
};
}  // namespace

int main(int argc, char** argv) {
    const int frames = argc > 1 ? std::atoi(argv[1]) : 10000;
    SoakEngine engine;
    engine.init();
    LQ::Image mono(LQ::Size(640, 360), LQ::COLOR_MODE_MONO);
    for (int y = 0; y < mono.height(); ++y)
        for (int x = 0; x < mono.width(); ++x) mono.pixel(x, y)[0] = static_cast<unsigned char>((x * x + 3 * y) >> 2);
    LQ::ViFrameParameters parameters;
    parameters.images["mono"] = mono;
    for (int frame = 1; frame <= frames; ++frame) {
        engine.processFrame(parameters);
        if (frame == 1000 || frame == frames || frame % 2500 == 0)
            std::printf("frame %6d  peak resident %ld KiB  live aggregators %zu\n", frame, peakResidentKiB(),
                        LQ::StateAggregator::liveCount());
    }
    std::printf("checksum %lu\n", engine.checksum_);
    return 0;
}
