#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

#ifdef TACTUS_WITH_OPENCV
#include <opencv2/imgcodecs.hpp>
#endif
#ifdef TACTUS_WITH_FFMPEG
extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
}
#endif

#include "clips.h"

namespace fs = std::filesystem;

namespace {

// A fresh folder under the system's temp directory, removed with its files at the end.
class TempDir {
public:
    TempDir() {
        std::string pattern = (fs::temp_directory_path() / "tactus_clips_XXXXXX").string();
        if (!mkdtemp(pattern.data())) throw std::runtime_error("mkdtemp failed");
        path_ = pattern;
    }
    ~TempDir() {
        std::error_code ignored;
        fs::remove_all(path_, ignored);
    }
    std::string operator/(const std::string& name) const { return (path_ / name).string(); }
    std::string str() const { return path_.string(); }

private:
    fs::path path_;
};

void writeFile(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

// The message of what f throws, or "" when it does not throw.
template <class F>
std::string thrown(F f) {
    try {
        f();
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "";
}

struct Rgb {
    int r, g, b;
};

// BT.601 limited range with the exact coefficients, the reference for the fixed-point code.
double lumaOf(Rgb c) { return 16 + (65.481 * c.r + 128.553 * c.g + 24.966 * c.b) / 255; }
double blueOf(Rgb c) { return 128 + (-37.797 * c.r - 74.203 * c.g + 112.0 * c.b) / 255; }
double redOf(Rgb c) { return 128 + (112.0 * c.r - 93.786 * c.g - 18.214 * c.b) / 255; }

// Checks an NV21 frame of the even top-left part of an RGB picture (row-major, width w).
void expectNv21(const std::vector<unsigned char>& frame, const std::vector<Rgb>& picture, int w, int width,
                int height, double tolerance) {
    ASSERT_EQ(frame.size(), size_t(width) * height * 3 / 2);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            EXPECT_NEAR(frame[y * width + x], lumaOf(picture[y * w + x]), tolerance) << "Y at " << x << "," << y;
    for (int y = 0; y < height / 2; ++y)
        for (int x = 0; x < width / 2; ++x) {
            Rgb mean{0, 0, 0};
            for (int dy = 0; dy < 2; ++dy)
                for (int dx = 0; dx < 2; ++dx) {
                    const Rgb& c = picture[(2 * y + dy) * w + 2 * x + dx];
                    mean.r += c.r, mean.g += c.g, mean.b += c.b;
                }
            // the formulas are linear: the chroma of the mean is the mean of the chroma
            const double v = (redOf(mean) - 128) / 4 + 128, u = (blueOf(mean) - 128) / 4 + 128;
            const size_t at = size_t(width) * height + size_t(y) * width + 2 * x;
            EXPECT_NEAR(frame[at], v, tolerance) << "V at " << x << "," << y;
            EXPECT_NEAR(frame[at + 1], u, tolerance) << "U at " << x << "," << y;
        }
}

#ifdef TACTUS_WITH_OPENCV
void writeImage(const std::string& path, const std::vector<Rgb>& picture, int width, int height) {
    cv::Mat bgr(height, width, CV_8UC3);
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            const Rgb& c = picture[y * width + x];
            bgr.at<cv::Vec3b>(y, x) = cv::Vec3b(c.b, c.g, c.r);
        }
    ASSERT_TRUE(cv::imwrite(path, bgr)) << path;
}

std::vector<Rgb> solid(Rgb colour, int width, int height) { return std::vector<Rgb>(width * height, colour); }
#endif

}  // namespace

#ifndef TACTUS_WITH_OPENCV
TEST(ImageFolderClip, NeedsOpenCv) { GTEST_SKIP() << "built without OpenCV's imgcodecs"; }
#else

TEST(ImageFolderClip, ReadsEachFormatInNameOrderAsBt601) {
    // 6x2: a block of each colour, then a block split between them down the middle
    const Rgb skin{200, 60, 30}, sky{20, 120, 220};
    std::vector<Rgb> blocks(12), swapped(12);
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 6; ++x) {
            const bool first = x < 2 || x == 4;
            blocks[y * 6 + x] = first ? skin : sky;
            swapped[y * 6 + x] = first ? sky : skin;
        }
    std::vector<Rgb> grey(12);
    for (int i = 0; i < 12; ++i) grey[i] = {i * 20, i * 20, i * 20};
    TempDir dir;
    writeImage(dir / "1.bmp", blocks, 6, 2);
    writeImage(dir / "2.png", swapped, 6, 2);
    cv::Mat greyMat(2, 6, CV_8UC1);
    for (int i = 0; i < 12; ++i) greyMat.data[i] = static_cast<unsigned char>(i * 20);
    ASSERT_TRUE(cv::imwrite(dir / "3.pgm", greyMat));
    writeImage(dir / "4.ppm", swapped, 6, 2);
    writeImage(dir / "5.JPG", solid(skin, 6, 2), 6, 2);
    writeFile(dir / "0-notes.txt", "not an image");
    fs::create_directory(dir / "0-folder.png");

    std::unique_ptr<Clip> clip = openImageFolder(dir.str());
    ASSERT_TRUE(clip->width == 6 && clip->height == 2);
    std::vector<unsigned char> frame;
    const std::vector<Rgb>* expected[] = {&blocks, &swapped, &grey, &swapped};
    for (const std::vector<Rgb>* picture : expected) {
        ASSERT_TRUE(clip->next(frame));
        expectNv21(frame, *picture, 6, 6, 2, 1.0);
    }
    // a lossy codec: near the colour, not on it
    ASSERT_TRUE(clip->next(frame));
    expectNv21(frame, solid(skin, 6, 2), 6, 6, 2, 4.0);
    EXPECT_FALSE(clip->next(frame));
}

TEST(ImageFolderClip, CropsTheOddLastRowAndColumn) {
    // every pixel different, so a crop from the wrong side shows
    std::vector<Rgb> ramp(7 * 5);
    for (int y = 0; y < 5; ++y)
        for (int x = 0; x < 7; ++x) ramp[y * 7 + x] = {30 * x + 5 * y, 255 - 40 * y, 10 + 20 * x + 25 * y};
    TempDir dir;
    writeImage(dir / "a.png", ramp, 7, 5);
    writeImage(dir / "b.png", ramp, 7, 5);
    std::unique_ptr<Clip> clip = openImageFolder(dir.str());
    EXPECT_TRUE(clip->width == 6 && clip->height == 4);
    std::vector<unsigned char> frame;
    for (int i = 0; i < 2; ++i) {
        ASSERT_TRUE(clip->next(frame));
        expectNv21(frame, ramp, 7, 6, 4, 1.0);
    }
    EXPECT_FALSE(clip->next(frame));
}

TEST(ImageFolderClip, ReportsWhatCannotBeRead) {
    TempDir dir;
    EXPECT_NE(thrown([&] { openImageFolder(dir / "missing"); }).find("cannot read the folder"), std::string::npos);
    writeFile(dir / "notes.txt", "not an image");
    EXPECT_NE(thrown([&] { openImageFolder(dir.str()); }).find("no image files in"), std::string::npos);

    // the first image sets the size: the second one's is an error when its turn comes
    writeImage(dir / "a.png", solid({1, 2, 3}, 8, 4), 8, 4);
    writeImage(dir / "b.png", solid({1, 2, 3}, 6, 4), 6, 4);
    writeFile(dir / "c.png", "not a png");
    std::unique_ptr<Clip> clip = openImageFolder(dir.str());
    std::vector<unsigned char> frame;
    EXPECT_TRUE(clip->next(frame));
    EXPECT_EQ(thrown([&] { clip->next(frame); }),
              dir / "b.png" + " is 6x4, the first image " + dir / "a.png" + " is 8x4");
    fs::remove(dir / "b.png");
    clip = openImageFolder(dir.str());
    EXPECT_TRUE(clip->next(frame));
    EXPECT_EQ(thrown([&] { clip->next(frame); }), "cannot decode the image " + dir / "c.png");
}

#endif

TEST(Y4mClip, InterleavesVuAndCropsOddSizes) {
    TempDir dir;
    // 4x2, two frames: luma, then the U plane, then the V plane
    writeFile(dir / "even.y4m", std::string("YUV4MPEG2 W4 H2 F30:1 Ip A1:1 C420jpeg\n") + "FRAME\n" +
                                    "\x01\x02\x03\x04\x05\x06\x07\x08" + "\x10\x11" + "\x20\x21" + "FRAME Ixyz\n" +
                                    "\x31\x32\x33\x34\x35\x36\x37\x38" + "\x40\x41" + "\x50\x51");
    Y4mClip even(dir / "even.y4m");
    ASSERT_TRUE(even.width == 4 && even.height == 2);
    std::vector<unsigned char> frame;
    ASSERT_TRUE(even.next(frame));
    EXPECT_EQ(frame, (std::vector<unsigned char>{1, 2, 3, 4, 5, 6, 7, 8, 0x20, 0x10, 0x21, 0x11}));
    ASSERT_TRUE(even.next(frame));
    EXPECT_EQ(frame, (std::vector<unsigned char>{0x31, 0x32, 0x33, 0x34, 0x35, 0x36, 0x37, 0x38, 0x50, 0x40, 0x51, 0x41}));
    EXPECT_FALSE(even.next(frame));

    // 5x3: chroma planes of 3x2; the last column and row go
    std::string odd = "YUV4MPEG2 W5 H3 C420\nFRAME\n";
    for (int i = 0; i < 15; ++i) odd += static_cast<char>(i);
    odd += std::string("\x60\x61\x62\x63\x64\x65") + "\x70\x71\x72\x73\x74\x75";
    writeFile(dir / "odd.y4m", odd);
    Y4mClip cropped(dir / "odd.y4m");
    EXPECT_TRUE(cropped.width == 4 && cropped.height == 2);
    ASSERT_TRUE(cropped.next(frame));
    EXPECT_EQ(frame, (std::vector<unsigned char>{0, 1, 2, 3, 5, 6, 7, 8, 0x70, 0x60, 0x71, 0x61}));
    EXPECT_FALSE(cropped.next(frame));

    writeFile(dir / "deep.y4m", "YUV4MPEG2 W4 H2 C420p10\n");
    EXPECT_EQ(thrown([&] { Y4mClip{dir / "deep.y4m"}; }),
              dir / "deep.y4m" + ": only 8-bit 4:2:0 Y4M clips are read, not 420p10");
    writeFile(dir / "raw.y4m", "\x01\x02\x03");
    EXPECT_EQ(thrown([&] { Y4mClip{dir / "raw.y4m"}; }), dir / "raw.y4m" + " is not a YUV4MPEG2 file");
    EXPECT_EQ(thrown([&] { Y4mClip{dir / "missing.y4m"}; }), "cannot open " + dir / "missing.y4m");
}

#ifdef TACTUS_WITH_FFMPEG
namespace {

// Frames of a moving pattern in 4:2:0 planes, the source of the test video.
unsigned char lumaAt(int x, int y, int t) { return static_cast<unsigned char>(3 * x + 5 * y + 40 * t); }
unsigned char blueAt(int x, int y, int t) { return static_cast<unsigned char>(7 * x + y + 20 * t); }
unsigned char redAt(int x, int y, int t) { return static_cast<unsigned char>(x + 11 * y + 30 * t); }

struct Encoding {
    AVFormatContext* format = nullptr;
    AVCodecContext* encoder = nullptr;
    AVFrame* frame = nullptr;
    AVPacket* packet = nullptr;
    ~Encoding() {
        av_packet_free(&packet);
        av_frame_free(&frame);
        avcodec_free_context(&encoder);
        if (format && !(format->oformat->flags & AVFMT_NOFILE)) avio_closep(&format->pb);
        avformat_free_context(format);
    }
    // sends a frame (nullptr at the end) and writes out what the encoder has ready
    bool send(AVFrame* picture, AVStream* stream) {
        if (avcodec_send_frame(encoder, picture) < 0) return false;
        while (avcodec_receive_packet(encoder, packet) >= 0) {
            av_packet_rescale_ts(packet, encoder->time_base, stream->time_base);
            packet->stream_index = stream->index;
            if (av_interleaved_write_frame(format, packet) < 0) return false;
        }
        return true;
    }
};

// Writes frames of the pattern losslessly with FFV1 in Matroska; "" or why not.
std::string writeVideo(const std::string& path, int width, int height, int frames) {
    const AVCodec* codec = avcodec_find_encoder(AV_CODEC_ID_FFV1);
    if (!codec) return "no FFV1 encoder in this libavcodec";
    Encoding e;
    if (avformat_alloc_output_context2(&e.format, nullptr, "matroska", path.c_str()) < 0) return "no Matroska muxer";
    AVStream* stream = avformat_new_stream(e.format, nullptr);
    e.encoder = avcodec_alloc_context3(codec);
    e.encoder->width = width, e.encoder->height = height;
    e.encoder->pix_fmt = AV_PIX_FMT_YUV420P;
    e.encoder->time_base = {1, 25};
    if (e.format->oformat->flags & AVFMT_GLOBALHEADER) e.encoder->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
    if (avcodec_open2(e.encoder, codec, nullptr) < 0) return "cannot open the FFV1 encoder";
    avcodec_parameters_from_context(stream->codecpar, e.encoder);
    stream->time_base = e.encoder->time_base;
    if (avio_open(&e.format->pb, path.c_str(), AVIO_FLAG_WRITE) < 0 || avformat_write_header(e.format, nullptr) < 0)
        return "cannot write " + path;
    e.frame = av_frame_alloc();
    e.packet = av_packet_alloc();
    e.frame->format = AV_PIX_FMT_YUV420P;
    e.frame->width = width, e.frame->height = height;
    if (av_frame_get_buffer(e.frame, 0) < 0) return "out of memory";
    for (int t = 0; t < frames; ++t) {
        if (av_frame_make_writable(e.frame) < 0) return "out of memory";
        for (int y = 0; y < height; ++y)
            for (int x = 0; x < width; ++x) e.frame->data[0][y * e.frame->linesize[0] + x] = lumaAt(x, y, t);
        for (int y = 0; y < (height + 1) / 2; ++y)
            for (int x = 0; x < (width + 1) / 2; ++x) {
                e.frame->data[1][y * e.frame->linesize[1] + x] = blueAt(x, y, t);
                e.frame->data[2][y * e.frame->linesize[2] + x] = redAt(x, y, t);
            }
        e.frame->pts = t;
        if (!e.send(e.frame, stream)) return "encoding failed";
    }
    if (!e.send(nullptr, stream) || av_write_trailer(e.format) < 0) return "encoding failed";
    return "";
}

}  // namespace

TEST(VideoClip, DecodesEveryFrameExactlyAndCropsToEven) {
    TempDir dir;
    // the odd size also checks the crop: 65x49 is read as 64x48
    const std::string why = writeVideo(dir / "clip.mkv", 65, 49, 3);
    if (!why.empty()) GTEST_SKIP() << why;
    std::unique_ptr<Clip> clip = openVideo(dir / "clip.mkv");
    ASSERT_TRUE(clip->width == 64 && clip->height == 48);
    std::vector<unsigned char> frame, expected(64 * 48 * 3 / 2);
    for (int t = 0; t < 3; ++t) {
        for (int y = 0; y < 48; ++y)
            for (int x = 0; x < 64; ++x) expected[y * 64 + x] = lumaAt(x, y, t);
        for (int y = 0; y < 24; ++y)
            for (int x = 0; x < 32; ++x) {
                expected[64 * 48 + y * 64 + 2 * x] = redAt(x, y, t);
                expected[64 * 48 + y * 64 + 2 * x + 1] = blueAt(x, y, t);
            }
        ASSERT_TRUE(clip->next(frame)) << "frame " << t;
        EXPECT_EQ(frame, expected) << "frame " << t;
    }
    EXPECT_FALSE(clip->next(frame));
}

TEST(VideoClip, ReportsFilesWithoutAVideo) {
    TempDir dir;
    writeFile(dir / "text.mp4", "this is not a video at all, just some text that no demuxer takes");
    for (const std::string& bad : {dir / "missing.mp4", dir / "text.mp4"})
        EXPECT_EQ(thrown([&] { openVideo(bad); }).find("cannot open the video " + bad), 0u);
    // a WAV file: 16-bit mono PCM at 8 kHz, eight silent samples, and no picture
    const std::string header("RIFF\x34\0\0\0WAVEfmt \x10\0\0\0\x01\0\x01\0\x40\x1f\0\0\x80\x3e\0\0"
                             "\x02\0\x10\0data\x10\0\0\0", 44);
    writeFile(dir / "sound.wav", header + std::string(16, '\0'));
    EXPECT_EQ(thrown([&] { openVideo(dir / "sound.wav"); }), "no video stream in " + dir / "sound.wav");
}
#else
TEST(VideoClip, NeedsFfmpeg) { GTEST_SKIP() << "built without FFmpeg's libraries"; }
#endif
