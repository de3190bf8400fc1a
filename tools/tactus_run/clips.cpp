#include "clips.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <sstream>
#include <stdexcept>

RawClip::RawClip(const std::string& path, int w, int h) : file_(path, std::ios::binary) {
    if (!file_) throw std::runtime_error("cannot open " + path);
    width = w;
    height = h;
}

bool RawClip::next(std::vector<unsigned char>& frame) {
    frame.resize(static_cast<size_t>(width) * height * 3 / 2);
    return static_cast<bool>(file_.read(reinterpret_cast<char*>(frame.data()), frame.size()));
}

Y4mClip::Y4mClip(const std::string& path) : file_(path, std::ios::binary) {
    if (!file_) throw std::runtime_error("cannot open " + path);
    std::string header;
    std::getline(file_, header);
    if (header.compare(0, 10, "YUV4MPEG2 ") != 0) throw std::runtime_error(path + " is not a YUV4MPEG2 file");
    std::istringstream fields(header.substr(10));
    std::string field;
    while (fields >> field) {
        if (field[0] == 'W') fileWidth_ = std::atoi(field.c_str() + 1);
        if (field[0] == 'H') fileHeight_ = std::atoi(field.c_str() + 1);
        // the 4:2:0 variants differ only in chroma siting; "C420p10" and the like are not 8-bit
        if (field[0] == 'C' && field != "C420" && field != "C420jpeg" && field != "C420paldv" && field != "C420mpeg2")
            throw std::runtime_error(path + ": only 8-bit 4:2:0 Y4M clips are read, not " + field.substr(1));
    }
    if (fileWidth_ < 2 || fileHeight_ < 2 || fileWidth_ > 8192 || fileHeight_ > 8192)
        throw std::runtime_error(path + ": unsupported Y4M frame size");
    width = fileWidth_ & ~1;
    height = fileHeight_ & ~1;
}

bool Y4mClip::next(std::vector<unsigned char>& frame) {
    std::string marker;
    if (!std::getline(file_, marker) || marker.compare(0, 5, "FRAME") != 0) return false;
    const size_t chromaWidth = (fileWidth_ + 1) / 2, chromaHeight = (fileHeight_ + 1) / 2;
    const size_t luma = static_cast<size_t>(fileWidth_) * fileHeight_, chroma = chromaWidth * chromaHeight;
    planes_.resize(luma + 2 * chroma);
    if (!file_.read(reinterpret_cast<char*>(planes_.data()), planes_.size())) return false;
    frame.resize(static_cast<size_t>(width) * height * 3 / 2);
    for (int y = 0; y < height; ++y)
        std::memcpy(frame.data() + static_cast<size_t>(y) * width, planes_.data() + y * size_t(fileWidth_), width);
    unsigned char* vu = frame.data() + static_cast<size_t>(width) * height;
    const unsigned char* u = planes_.data() + luma;
    const unsigned char* v = u + chroma;
    for (int y = 0; y < height / 2; ++y)
        for (int x = 0; x < width / 2; ++x) {
            vu[y * size_t(width) + 2 * x] = v[y * chromaWidth + x];
            vu[y * size_t(width) + 2 * x + 1] = u[y * chromaWidth + x];
        }
    return true;
}

SampleClip::SampleClip(int frames) : frames_(frames) {
    width = 1280;
    height = 720;
}

bool SampleClip::next(std::vector<unsigned char>& frame) {
    if (index_ >= frames_) return false;
    frame.resize(static_cast<size_t>(width) * height * 3 / 2);
    const float cx = width * (0.25f + 0.5f * index_ / std::max(1, frames_ - 1));
    const float cy = height * (0.5f + 0.2f * std::sin(index_ * 0.3f));
    const float radius = height * 0.15f;
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            const float dx = x - cx, dy = y - cy;
            const bool inside = dx * dx + dy * dy < radius * radius;
            frame[static_cast<size_t>(y) * width + x] =
                static_cast<unsigned char>(inside ? 170 : 40 + (x + y) * 100 / (width + height));
        }
    unsigned char* chroma = frame.data() + static_cast<size_t>(width) * height;
    for (int y = 0; y < height / 2; ++y)
        for (int x = 0; x < width / 2; ++x) {
            const float dx = 2 * x - cx, dy = 2 * y - cy;
            const bool inside = dx * dx + dy * dy < radius * radius;
            chroma[y * width + 2 * x] = inside ? 150 : 128;      // V
            chroma[y * width + 2 * x + 1] = inside ? 110 : 128;  // U
        }
    ++index_;
    return true;
}

// 8-bit fixed-point BT.601 coefficients; the offsets are folded in so that every sum is
// positive before the shift.
void rgbToNv21(const unsigned char* rgb, std::size_t rowStride, int width, int height, unsigned char* nv21) {
    width &= ~1;
    height &= ~1;
    for (int y = 0; y < height; ++y) {
        const unsigned char* in = rgb + y * rowStride;
        unsigned char* out = nv21 + static_cast<size_t>(y) * width;
        for (int x = 0; x < width; ++x) {
            const int r = in[3 * x], g = in[3 * x + 1], b = in[3 * x + 2];
            out[x] = static_cast<unsigned char>((66 * r + 129 * g + 25 * b + 128 + (16 << 8)) >> 8);
        }
    }
    unsigned char* vu = nv21 + static_cast<size_t>(width) * height;
    for (int y = 0; y < height / 2; ++y) {
        const unsigned char* top = rgb + 2 * y * rowStride;
        const unsigned char* bottom = top + rowStride;
        unsigned char* out = vu + static_cast<size_t>(y) * width;
        for (int x = 0; x < width / 2; ++x) {
            const int i = 6 * x;
            const int r = top[i] + top[i + 3] + bottom[i] + bottom[i + 3];
            const int g = top[i + 1] + top[i + 4] + bottom[i + 1] + bottom[i + 4];
            const int b = top[i + 2] + top[i + 5] + bottom[i + 2] + bottom[i + 5];
            // sums of four pixels: shift by two more bits
            out[2 * x] = static_cast<unsigned char>((112 * r - 94 * g - 18 * b + 512 + (128 << 10)) >> 10);
            out[2 * x + 1] = static_cast<unsigned char>((-38 * r - 74 * g + 112 * b + 512 + (128 << 10)) >> 10);
        }
    }
}

#ifndef TACTUS_WITH_OPENCV
std::unique_ptr<Clip> openImageFolder(const std::string&) {
    throw std::runtime_error("this tactus_run was built without OpenCV's imgcodecs: --images is not available");
}
#endif

#ifndef TACTUS_WITH_FFMPEG
std::unique_ptr<Clip> openVideo(const std::string&) {
    throw std::runtime_error("this tactus_run was built without FFmpeg's libraries: --video is not available");
}
#endif
