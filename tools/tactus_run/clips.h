#pragma once
// Sources of NV21 frames for the host program: luma rows, then rows of V, U pairs at
// half resolution, as a camera preview delivers them. Readers throw std::runtime_error
// with a message for the user when a clip cannot be read.

#include <cstdint>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

class Clip {
public:
    virtual ~Clip() = default;
    // The next frame, width * height * 3 / 2 bytes; false at the end of the clip.
    virtual bool next(std::vector<unsigned char>& frame) = 0;
    int width = 0, height = 0;
};

class RawClip : public Clip {
public:
    RawClip(const std::string& path, int width, int height);
    bool next(std::vector<unsigned char>& frame) override;

private:
    std::ifstream file_;
};

// YUV4MPEG2 with 8-bit 4:2:0 planes; an odd last row or column is dropped.
class Y4mClip : public Clip {
public:
    explicit Y4mClip(const std::string& path);
    bool next(std::vector<unsigned char>& frame) override;

private:
    std::ifstream file_;
    int fileWidth_ = 0, fileHeight_ = 0;
    std::vector<unsigned char> planes_;
};

// A generated clip: a skin-toned disc drifting over a graded background.
class SampleClip : public Clip {
public:
    explicit SampleClip(int frames);
    bool next(std::vector<unsigned char>& frame) override;

private:
    int frames_;
    int index_ = 0;
};

// Interleaved 8-bit RGB to NV21, BT.601 limited range: the inverse of the camera's
// conversion. Only the even top-left part is converted; each chroma pair is taken from
// the mean colour of its 2x2 block. rowStride is in bytes.
void rgbToNv21(const unsigned char* rgb, std::size_t rowStride, int width, int height, unsigned char* nv21);

// Every image file of a folder (by extension: PNG, JPEG, PPM/PGM/PNM, BMP, TIFF, WebP)
// in name order; all must have the size of the first. Needs OpenCV's imgcodecs.
std::unique_ptr<Clip> openImageFolder(const std::string& directory);

// Any video FFmpeg can demux and decode, at its own size cropped to even.
std::unique_ptr<Clip> openVideo(const std::string& path);
