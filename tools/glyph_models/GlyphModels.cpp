#include "GlyphModels.h"

#include <algorithm>
#include <fstream>
#include <stdexcept>

#include "ClassifierRing.h"
#include "DataLayer.h"
#include "InnerProductLayer.h"
#include "LQ_ArchiveO.h"
#include "NnDetector.h"

namespace glyphModels {

namespace {

void writeRing(const std::string& directory, const char* name, const glyphs::Glyph& glyph) {
    glyphs::Tables tables(true);
    CascadedClassifier base = glyphs::cascade(glyph, tables, name);
    ClassifierRing ring(std::vector<CascadedClassifier*>{&base});
    ring.setName(name);
    if (!ring.save(directory + "/" + name + ".ring")) throw std::runtime_error(std::string("cannot write ") + name);
}

// a 12 x 12 patch to one fixed value: zero weights and the answer as the bias
void writeNetwork(const std::string& path, const std::vector<float>& answer, int channels = 1) {
    NnDetector net;
    net.setName(path.substr(path.rfind('/') + 1));
    LQ::SharedPtr<BaseLayer> data(new DataLayer("data"));
    net.addLayer(data);
    const int outputs = static_cast<int>(answer.size());
    Blob weights(1, 1, outputs, 144 * channels);
    for (int i = 0; i < weights.size(); ++i) weights.data()[i] = 0;
    Blob bias(1, 1, 1, outputs);
    for (int i = 0; i < outputs; ++i) bias.data()[i] = answer[i];
    LQ::SharedPtr<BaseLayer> product(new InnerProductLayer(weights, bias, "answer"));
    product->addBottomLayer(data);
    net.addLayer(product);
    net.setSize(LQ::BaseSize<int>(12, 12));
    std::ofstream file(path, std::ios::binary);
    LQ::ArchiveO archive(file);
    archive & net;
    if (!file) throw std::runtime_error("cannot write " + path);
}

}  // namespace

void write(const std::string& directory, const Answers& answers) {
    writeRing(directory, "ada_Fist_2013_10_02__16_45_30", glyphs::kF);
    writeRing(directory, "ada_thumbUp_ada__2017_11_13__20_01_17", glyphs::kF);
    writeRing(directory, "ada_mono_ada_staticVictory_2017_11_10__14_34_17", glyphs::kF);
    writeRing(directory, "ada_mono_ada_staticPointer0_2015_06_23__19_25_48", glyphs::kF);
    writeRing(directory, "ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26", glyphs::kF);
    writeRing(directory, "ada__ada_staticPalm_2014_12_05__17_40_12", glyphs::kFrame);
    writeNetwork(directory + "/thumbUp_verifier_iter_55000.nn", {answers.thumbUp});
    writeNetwork(directory + "/heart_verifier_vent_iter_60000.nn", {answers.heart});
    writeNetwork(directory + "/victory_verifier_face_pos_color_2017_12_14__iter_39000.nn", {answers.victory}, 3);
    writeNetwork(directory + "/pointer_verifier__iter_18000.nn", {answers.pointer});
    // the second class wins: the hand-side reader turns a right hand into a left one
    writeNetwork(directory + "/pointer_hand_side__iter_7500.nn", {1 - answers.sideWrong, answers.sideWrong});
    writeNetwork(directory + "/fist_verifier_iter_135000.nn", {answers.fist});
    writeNetwork(directory + "/palm_verifier__iter_250000.nn", {answers.palm});
    writeNetwork(directory + "/palm_verifier_iter_140000.nn", {answers.palm});
}

Answers permissiveAnswers() {
    Answers answers;
    answers.pointer = 1;
    answers.palm = 0;
    answers.sideWrong = 0;
    return answers;
}

Frame::Frame(int turns) : turns_(turns % 4), nv21_(kCameraWidth * kCameraHeight * 3 / 2, 128) {
    std::fill(nv21_.begin(), nv21_.begin() + kCameraWidth * kCameraHeight, glyphs::kDark);
}

void Frame::toUpright(int x, int y, float& u, float& v) const {
    const int W = kCameraWidth / 2, H = kCameraHeight / 2;
    switch (turns_) {
        case 1: u = y, v = W - 1 - x; break;
        case 2: u = W - 1 - x, v = H - 1 - y; break;
        case 3: u = H - 1 - y, v = x; break;
        default: u = x, v = y; break;
    }
}

void Frame::draw(const glyphs::Glyph& glyph, float left, float top, float scale) {
    for (int Y = 0; Y < kCameraHeight; ++Y)
        for (int X = 0; X < kCameraWidth; ++X) {
            float u, v;
            toUpright(X / 2, Y / 2, u, v);
            if (glyph.covers((u + 0.5f - left) / scale, (v + 0.5f - top) / scale))
                nv21_[Y * kCameraWidth + X] = glyphs::kBright;
        }
}

LQ::BaseRect<float> Frame::cameraBox(const LQ::BaseRect<float>& upright) const {
    LQ::BaseRect<float> box(kCameraWidth, kCameraHeight, 0, 0);
    for (int Y = 0; Y < kCameraHeight; Y += 2)
        for (int X = 0; X < kCameraWidth; X += 2) {
            float u, v;
            toUpright(X / 2, Y / 2, u, v);
            if (u < upright.left || u >= upright.right || v < upright.top || v >= upright.bottom) continue;
            box.left = std::min<float>(box.left, X);
            box.top = std::min<float>(box.top, Y);
            box.right = std::max<float>(box.right, X + 2);
            box.bottom = std::max<float>(box.bottom, Y + 2);
        }
    return box;
}

}  // namespace glyphModels
