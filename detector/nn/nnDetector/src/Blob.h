#pragma once
// The network runtime's tensor: num x channels x height x width 32-bit floats, planar and
// row-major. Copies share memory: layers that work in place rest on that.

#include <istream>
#include <ostream>
#include <string>
#include <vector>

#include "LQ_ArchiveI.h"
#include "LQ_ArchiveO.h"
#include "LQ_Image.h"
#include "LQ_SharedPtr.h"

class Blob {
public:
    // more elements than this in one blob means a corrupt model file
    static constexpr long long MAX_SIZE = 1LL << 26;

    Blob() = default;
    Blob(int num, int channels, int height, int width) { init(num, channels, height, width); }
    Blob(const Blob& blob) { *this = blob; }
    Blob& operator=(const Blob& blob);

    // an unchanged shape costs four comparisons; an unchanged count keeps the memory
    void init(int num, int channels, int height, int width);
    void init(int num, int channels, int height, int width, const LQ::SharedArray<float>& memory);
    // wraps memory that outlives the blob, without copying it
    void init(int num, int channels, int height, int width, const float* data);
    void reset();

    int num() const { return num_; }
    int channels() const { return channels_; }
    int height() const { return height_; }
    int width() const { return width_; }
    int size() const { return num_ * channels_ * height_ * width_; }
    int area() const { return height_ * width_; }
    int volume() const { return channels_ * height_ * width_; }
    int offset(int n, int c, int y, int x) const { return ((n * channels_ + c) * height_ + y) * width_ + x; }
    float* data() { return data_; }
    const float* data() const { return data_; }
    float* data(int n, int c, int y, int x) { return data_ + offset(n, c, y, x); }
    const float* data(int n, int c, int y, int x) const { return data_ + offset(n, c, y, x); }
    const LQ::SharedArray<float>& getMemory() const { return memory_; }

    // equal shapes and bytewise equal floats
    bool operator==(const Blob& blob) const;
    bool operator!=(const Blob& blob) const { return !(*this == blob); }
    operator std::vector<float>() const;

    // values with a magnitude strictly below threshold become 0
    void zeroSmallValues(float threshold);
    // one image into sample num of a batch of maxNum, bytes scaled by 1/256
    static void convert(const LQ::Image& image, Blob& blob, int num, int maxNum);
    static void convert(const std::vector<float>& values, Blob& blob);
    // "num x channels x width x height"
    std::string shape() const;
    // logs a histogram of the values in hundredths
    void printDistribution() const;
    // a function of that name returning a static blob over a constant table
    void saveToCpp(std::ostream& stream, const std::string& name) const;

private:
    float* data_ = nullptr;
    int num_ = 0;
    int channels_ = 0;
    int height_ = 0;
    int width_ = 0;
    LQ::SharedArray<float> memory_;
};

// a float as a source literal: the shortest text that reads back the same float, and "f"
std::string floatLiteral(float value);

std::ostream& operator<<(std::ostream& stream, const Blob& blob);
std::istream& operator>>(std::istream& stream, Blob& blob);
LQ::ArchiveO& operator&(LQ::ArchiveO& archive, const Blob& blob);
// refuses negative and huge shapes; values below 1e-10 in magnitude are read as 0
LQ::ArchiveI& operator&(LQ::ArchiveI& archive, Blob& blob);
