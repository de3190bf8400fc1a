#pragma once
// A whole network as one value: its layers in execution order, the input size, how an
// image becomes the input blob, and which layers are the outputs.

#include <ostream>
#include <string>
#include <vector>

#include "BaseLayer.h"
#include "Blob.h"
#include "LQ_ArchiveI.h"
#include "LQ_ArchiveO.h"
#include "LQ_ColorMode.h"
#include "LQ_Image.h"
#include "LQ_SharedPtr.h"
#include "LQ_Size.h"

// the model file format this code writes, and the newest it reads
#define NN_CLASSIFIER_VERSION std::string("Version 8")

class NnDetector {
public:
    NnDetector() = default;

    // refused once the size is set
    void addLayer(const LQ::SharedPtr<BaseLayer>& layer);
    // seals the network
    void setSize(const LQ::BaseSize<int>& patternSize);
    const LQ::BaseSize<int>& getSize() const { return size_; }
    bool isLoaded() const { return size_.width * size_.height != 0; }
    // each layer from the second on reads the one before it
    void joinLayers();
    void updateOutputLayers();
    void prune();

    // detect writes the input blob and every layer's output: scratch space, not state
    const Blob& detect(const LQ::Image& image) const;
    const Blob& detect(const std::vector<LQ::Image>& images) const;
    const Blob& detect(Blob& input) const;
    void convert(const LQ::Image& image, Blob& blob, int index, int total) const;

    void setInputColorMode(const LQ::ColorMode& colorMode);
    LQ::ColorMode getInputColorMode() const { return inputColorMode_; }
    void setMultiplier(float multiplier) { multiplier_ = multiplier; }
    float getMultiplier() const { return multiplier_; }
    void setSamplewiseMeanImageSubtraction(bool value) { samplewise_ = value; }
    bool getSamplewiseMeanImageSubtraction() const { return samplewise_; }
    void setTranspose(bool value) { transpose_ = value; }
    bool getTranspose() const { return transpose_; }
    void setMeanValues(const std::vector<float>& meanValues);
    const std::vector<float>& getMeanValues() const { return meanValues_; }
    void setName(const std::string& name) { name_ = name; }
    const std::string& getName() const { return name_; }
    void setTrainLog(const std::string& log) { trainLog_ = log; }
    const std::string& getTrainLog() const { return trainLog_; }

    std::vector<Blob> getOutputBlobs();
    std::vector<std::string> getOutputNames();
    void setOutputLayers(const std::vector<std::string>& names);
    // back to building: size, layers and flags go, the rest stays
    void reset();
    static float getAccuracy(const std::vector<float>& results, unsigned int classNumber);
    const std::vector<LQ::SharedPtr<BaseLayer>>& getNetwork() const { return network_; }
    // an independent network sharing the weights
    LQ::SharedPtr<NnDetector> clone() const;

    bool operator==(const NnDetector& other) const;

    // the generated source form: a unit that builds this network from constant tables
    bool saveToCpp(const std::string& fileName);
    void saveToCpp(std::ostream& stream, const std::string& name);

    friend LQ::ArchiveI& operator&(LQ::ArchiveI& archive, NnDetector& detector);
    friend LQ::ArchiveO& operator&(LQ::ArchiveO& archive, const NnDetector& detector);

private:
    void prepareOutputFlags();

    LQ::ColorMode inputColorMode_ = LQ::COLOR_MODE_MONO;
    mutable Blob inputBlob_;
    std::string name_;
    std::string trainLog_;
    LQ::BaseSize<int> size_;
    float multiplier_ = 0.00390625f;
    bool transpose_ = false;
    // in samplewise mode these are the accumulators of the image means
    mutable std::vector<float> meanValues_ = std::vector<float>(1, 0.f);
    bool samplewise_ = false;
    std::vector<LQ::SharedPtr<BaseLayer>> network_;
    std::vector<bool> outputLayers_;
    bool automaticOutputs_ = true;
};

LQ::ArchiveI& operator&(LQ::ArchiveI& archive, NnDetector& detector);
// always in the current format
LQ::ArchiveO& operator&(LQ::ArchiveO& archive, const NnDetector& detector);
