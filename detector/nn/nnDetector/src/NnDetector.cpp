#include "NnDetector.h"

#include <algorithm>
#include <cmath>
#include <fstream>
#include <map>
#include <sstream>

#include "LQ_Check.h"
#include "LQ_Stream.h"
#include "LQ_Utils.h"

namespace {
// more layers than this in a model file means a corrupt file
constexpr unsigned int MAX_LAYERS = 100000;

std::string names(const std::vector<std::string>& list) {
    std::ostringstream text;
    LQ::StreamO(text) << list;
    return text.str();
}
}  // namespace

void NnDetector::addLayer(const LQ::SharedPtr<BaseLayer>& layer) {
    LQ_ASSERT_MSG(size_ == LQ::Size(), "size must be inicialized after");
    network_.push_back(layer);
    outputLayers_.push_back(true);
}

void NnDetector::setSize(const LQ::BaseSize<int>& patternSize) {
    LQ_ASSERT_MSG(patternSize.area(), "pattern can't be empty");
    size_ = patternSize;
    updateOutputLayers();
}

void NnDetector::joinLayers() {
    for (size_t i = 1; i < network_.size(); ++i) network_[i]->addBottomLayer(network_[i - 1]);
}

void NnDetector::updateOutputLayers() {
    if (!automaticOutputs_) return;
    for (size_t i = 0; i < network_.size() && i < outputLayers_.size(); ++i) {
        if (!outputLayers_[i]) continue;
        const std::string type = network_[i]->type();
        if (type == "ReluLayer" || type == "PReluLayer") {
            outputLayers_[i] = false;
            continue;
        }
        for (const LQ::SharedPtr<BaseLayer>& layer : network_) {
            const std::vector<std::string> bottoms = layer->getBottomLayersName();
            if (std::find(bottoms.begin(), bottoms.end(), network_[i]->name()) != bottoms.end()) {
                outputLayers_[i] = false;
                break;
            }
        }
    }
}

void NnDetector::prune() {
    for (LQ::SharedPtr<BaseLayer>& layer : network_) layer->prune();
}

const Blob& NnDetector::detect(const LQ::Image& image) const {
    LQ_ASSERT_GT(network_.size(), 0);
    LQ::checkColorMode(image, inputColorMode_);
    convert(image, inputBlob_, 0, 1);
    return detect(inputBlob_);
}

const Blob& NnDetector::detect(const std::vector<LQ::Image>& images) const {
    LQ_ASSERT_GT(network_.size(), 0);
    for (size_t i = 0; i < images.size(); ++i) {
        LQ::checkColorMode(images[i], inputColorMode_);
        convert(images[i], inputBlob_, static_cast<int>(i), static_cast<int>(images.size()));
    }
    return detect(inputBlob_);
}

const Blob& NnDetector::detect(Blob& input) const {
    LQ_ASSERT_GT(network_.size(), 0);
    network_[0]->setBlob(input);
    for (const LQ::SharedPtr<BaseLayer>& layer : network_) layer->forward();
    return network_.back()->getBlob();
}

void NnDetector::convert(const LQ::Image& image, Blob& blob, int index, int total) const {
    const int W = image.width(), H = image.height(), D = image.depth();
    if (samplewise_) {
        meanValues_.resize(D, 0.f);
        for (int y = 0; y < H; ++y) {
            const unsigned char* row = image.data() + static_cast<size_t>(y) * image.stripLength();
            for (int x = 0; x < W; ++x)
                for (int k = 0; k < D; ++k) meanValues_[k] += static_cast<float>(row[x * D + k]);
        }
        for (int k = 0; k < D; ++k) meanValues_[k] /= static_cast<float>(W * H);
    }
    LQ_ASSERT_GE(static_cast<int>(meanValues_.size()), D);
    if (transpose_)
        blob.init(total, D, W, H);
    else
        blob.init(total, D, H, W);
    float* p = blob.data(index, 0, 0, 0);
    const float multiplier = multiplier_;
    const int plane = W * H;
    for (int y = 0; y < H; ++y) {
        const unsigned char* row = image.data() + static_cast<size_t>(y) * image.stripLength();
        for (int k = 0; k < D; ++k) {
            const float mean = meanValues_[k];
            if (!transpose_) {
                float* out = p + k * plane + y * W;
                for (int x = 0; x < W; ++x) out[x] = (static_cast<float>(row[x * D + k]) - mean) * multiplier;
            } else {
                // rows and columns change places, and the channel order turns round
                float* out = p + (D - 1 - k) * plane + y;
                for (int x = 0; x < W; ++x) out[x * H] = (static_cast<float>(row[x * D + k]) - mean) * multiplier;
            }
        }
    }
}

void NnDetector::setInputColorMode(const LQ::ColorMode& colorMode) {
    inputColorMode_ = colorMode;
    meanValues_.resize(LQ::depth(colorMode), 0.f);
}

void NnDetector::setMeanValues(const std::vector<float>& meanValues) {
    LQ_ASSERT_EQ((LQ::uint)LQ::depth(inputColorMode_), meanValues_.size());
    meanValues_ = meanValues;
}

void NnDetector::prepareOutputFlags() {
    if (!outputLayers_.empty()) return;
    outputLayers_.assign(network_.size(), true);
    updateOutputLayers();
}

std::vector<Blob> NnDetector::getOutputBlobs() {
    prepareOutputFlags();
    std::vector<Blob> blobs;
    for (size_t i = 0; i < network_.size(); ++i)
        if (outputLayers_[i]) blobs.push_back(network_[i]->getBlob());
    return blobs;
}

std::vector<std::string> NnDetector::getOutputNames() {
    prepareOutputFlags();
    std::vector<std::string> names;
    for (size_t i = 0; i < network_.size(); ++i)
        if (outputLayers_[i]) names.push_back(network_[i]->name());
    return names;
}

void NnDetector::setOutputLayers(const std::vector<std::string>& names) {
    automaticOutputs_ = false;
    outputLayers_.assign(network_.size(), false);
    for (size_t i = 0; i < network_.size(); ++i)
        if (std::find(names.begin(), names.end(), network_[i]->name()) != names.end()) outputLayers_[i] = true;
}

void NnDetector::reset() {
    size_ = LQ::BaseSize<int>();
    network_.clear();
    outputLayers_.clear();
}

float NnDetector::getAccuracy(const std::vector<float>& results, unsigned int classNumber) {
    LQ_ASSERT_MSG(classNumber < results.size(), "incorrect class number " << classNumber);
    float sum = 0.f;
    for (float value : results) sum += expf(value);
    return expf(results[classNumber]) / sum;
}

LQ::SharedPtr<NnDetector> NnDetector::clone() const {
    LQ::SharedPtr<NnDetector> copy(new NnDetector());
    copy->inputColorMode_ = inputColorMode_;
    copy->name_ = name_;
    copy->trainLog_ = trainLog_;
    copy->size_ = size_;
    copy->multiplier_ = multiplier_;
    copy->transpose_ = transpose_;
    copy->meanValues_ = meanValues_;
    copy->samplewise_ = samplewise_;
    copy->outputLayers_ = outputLayers_;
    copy->automaticOutputs_ = automaticOutputs_;
    for (size_t i = 0; i < network_.size(); ++i) {
        LQ::SharedPtr<BaseLayer> pLayer = network_[i]->clone();
        for (const std::string& bottom : network_[i]->getBottomLayersName())
            for (const LQ::SharedPtr<BaseLayer>& made : copy->network_)
                if (made->name() == bottom) pLayer->addBottomLayer(made);
        LQ_ASSERT_MSG((pLayer->getBottomLayersName()) == (network_[i]->getBottomLayersName()),
                      names(pLayer->getBottomLayersName()) << " != " << names(network_[i]->getBottomLayersName()));
        copy->network_.push_back(pLayer);
    }
    return copy;
}

bool NnDetector::operator==(const NnDetector& other) const {
    if (inputColorMode_ != other.inputColorMode_ || name_ != other.name_ || size_ != other.size_ ||
        network_.size() != other.network_.size())
        return false;
    for (size_t i = 0; i < network_.size(); ++i)
        if (*network_[i] != *other.network_[i]) return false;
    return true;
}

LQ::ArchiveI& operator&(LQ::ArchiveI& archive, NnDetector& detector) {
    std::string version;
    archive & version & "\n";
    archive.setVersion(version);
    LQ_ASSERT_MSG(version <= NN_CLASSIFIER_VERSION, "Wrong version number " << version);
    archive & detector.name_ & "\n";
    archive & detector.size_ & "\n";
    LQ::ColorMode colorMode = LQ::COLOR_MODE_MONO;
    if (!archive.isBefore("Version 8")) {
        int32_t mode = 0;
        archive & mode & "\n";
        LQ_ASSERT_MSG(mode >= 0 && mode < LQ::COLOR_MODE_END, "unknown colour mode " << mode);
        colorMode = static_cast<LQ::ColorMode>(mode);
    }
    uint32_t count = 0;
    archive & count & "\n";
    LQ_ASSERT_MSG(count <= MAX_LAYERS, "too many layers: " << count);
    detector.network_.clear();
    detector.outputLayers_.clear();
    std::map<std::string, LQ::SharedPtr<BaseLayer>> byName;
    for (uint32_t i = 0; i < count; ++i) {
        LQ::SharedPtr<BaseLayer> layer = BaseLayer::loadBaseLayer(archive);
        layer->serialize(archive);
        byName[layer->name()] = layer;
        uint32_t bottoms = 0;
        archive & bottoms;
        LQ_ASSERT_MSG(bottoms <= count, "layer " << layer->name() << " has " << bottoms << " bottoms");
        for (uint32_t b = 0; b < bottoms; ++b) {
            std::string bottom;
            archive & bottom;
            layer->addBottomLayer(byName[bottom]);
        }
        archive & "\n";
        detector.network_.push_back(layer);
    }
    detector.inputColorMode_ = colorMode;
    detector.meanValues_.resize(LQ::depth(colorMode), 0.f);
    return archive;
}

LQ::ArchiveO& operator&(LQ::ArchiveO& archive, const NnDetector& detector) {
    archive.setVersion(NN_CLASSIFIER_VERSION);
    archive & NN_CLASSIFIER_VERSION & "\n";
    archive & detector.name_ & "\n";
    archive & detector.size_ & "\n";
    archive & static_cast<int32_t>(detector.inputColorMode_) & "\n";
    archive & static_cast<uint32_t>(detector.network_.size()) & "\n";
    for (const LQ::SharedPtr<BaseLayer>& layer : detector.network_) {
        layer->saveBaseLayer(archive);
        layer->serialize(archive);
        const std::vector<std::string> bottoms = layer->getBottomLayersName();
        archive & static_cast<uint32_t>(bottoms.size());
        for (const std::string& bottom : bottoms) archive & bottom;
        archive & "\n";
    }
    return archive;
}

bool NnDetector::saveToCpp(const std::string& fileName) {
    std::ofstream file(fileName.c_str(), std::ios::binary | std::ios::trunc);
    LQ_ASSERT_MSG(file, "cannot open file " << fileName);
    const size_t slash = fileName.find_last_of('/');
    std::string base = slash == std::string::npos ? fileName : fileName.substr(slash + 1);
    const size_t dot = base.rfind('.');
    if (dot != std::string::npos) base.erase(dot);
    saveToCpp(file, base);
    file.flush();
    return static_cast<bool>(file);
}

void NnDetector::saveToCpp(std::ostream& stream, const std::string& name) {
    const std::string& N = name;
    stream << "/**\n"
           << " * @file " << N << ".cpp\n"
           << " * @brief The network " << name_ << " as constant tables, written by NnDetector::saveToCpp.\n"
           << " * Do not edit; write it again from the network.\n"
           << " */\n";
    stream << "#include \"NNDetector.h\"\n";
    stream << "#ifdef __cplusplus\n"
           << "extern \"C\"\n"
           << "{\n"
           << "#endif //__cplusplus\n";
    stream << "// For exporting from a Windows DLL:\n"
           << "#ifdef WIN32\n"
           << "#   define DLL_DECLSPEC __declspec(dllexport)\n"
           << "#else\n"
           << "#   define DLL_DECLSPEC __attribute__ ((visibility (\"default\")))\n"
           << "#endif //WIN32\n";
    stream << "    DLL_DECLSPEC void " << N << "(NNDetector& detector);\n";
    stream << "#ifdef __cplusplus\n"
           << "}\n"
           << "#endif //__cplusplus\n\n";
    stream << "namespace " << N << "NameSpace" << "\n"
           << "{\n"
           << "\n";
    for (const LQ::SharedPtr<BaseLayer>& layer : network_) layer->saveToCpp(stream, fixName(layer->name()));
    stream << "NNDetector& " << N << "()\n"
           << "{\n"
           << "    static NNDetector nnDetector;\n\n"
           << "    if (nnDetector.isLoaded())\n"
           << "    {\n"
           << "        return nnDetector;\n"
           << "    }\n\n"
           << "    nnDetector.setName(\"" << N << "\");\n\n"
           << "    std::vector<float> meanValues;\n";
    for (float value : meanValues_) stream << "    meanValues.push_back(" << value << ");\n";
    stream << "    nnDetector.setMeanValues(meanValues);\n\n";
    for (size_t i = 0; i < network_.size(); ++i) {
        const std::string L = fixName(network_[i]->name());
        stream << "    // set layer #" << i << ":\n"
               << "    LQ::SharedPtr<BaseLayer> p_" << L << "(&" << L << "(), false);\n"
               << "    nnDetector.addLayer(p_" << L << ");\n";
        const std::vector<std::string> bottoms = network_[i]->getBottomLayersName();
        for (const std::string& bottom : bottoms) stream << "    p_" << L << "->addBottomLayer(p_" << fixName(bottom) << ");\n";
        if (!bottoms.empty()) stream << "\n";
    }
    stream << "    nnDetector.setSize(LQ::" << size_ << ");\n\n"
           << "    return nnDetector;\n"
           << "}\n"
           << "\n";
    stream << "} //" << N << "NameSpace" << "\n"
           << "\n";
    stream << "void " << N << "(NNDetector& nnDetector)\n"
           << "{\n"
           << "    nnDetector = " << N << "NameSpace::" << N << "();\n"
           << "}\n"
           << "\n";
    stream << "LQ::SharedPtr<NNDetector> " << N << "()\n"
           << "{\n"
           << "    return LQ::SharedPtr<NNDetector>(&" << N << "NameSpace::" << N << "(), false);\n"
           << "}\n"
           << "\n";
    std::istringstream log(trainLog_);
    std::string line;
    while (std::getline(log, line)) stream << "// " << line << "\n";
}
