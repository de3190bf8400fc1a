// Videos, demuxed and decoded by FFmpeg and converted to NV21 by libswscale.
#include <stdexcept>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/imgutils.h>
#include <libswscale/swscale.h>
}

#include "clips.h"

namespace {

std::string errorText(int code) {
    char text[AV_ERROR_MAX_STRING_SIZE] = {};
    av_strerror(code, text, sizeof(text));
    return text;
}

struct FormatCloser {
    void operator()(AVFormatContext* context) const { avformat_close_input(&context); }
};
struct CodecFreer {
    void operator()(AVCodecContext* context) const { avcodec_free_context(&context); }
};
struct FrameFreer {
    void operator()(AVFrame* frame) const { av_frame_free(&frame); }
};
struct PacketFreer {
    void operator()(AVPacket* packet) const { av_packet_free(&packet); }
};
struct ScaleFreer {
    void operator()(SwsContext* context) const { sws_freeContext(context); }
};

class VideoClip : public Clip {
public:
    explicit VideoClip(const std::string& path) : path_(path) {
        av_log_set_level(AV_LOG_ERROR);
        AVFormatContext* format = nullptr;
        int code = avformat_open_input(&format, path.c_str(), nullptr, nullptr);
        if (code < 0) throw std::runtime_error("cannot open the video " + path + ": " + errorText(code));
        format_.reset(format);
        code = avformat_find_stream_info(format, nullptr);
        if (code < 0) throw std::runtime_error("cannot read the streams of " + path + ": " + errorText(code));
        const AVCodec* codec = nullptr;
        stream_ = av_find_best_stream(format, AVMEDIA_TYPE_VIDEO, -1, -1, &codec, 0);
        if (stream_ == AVERROR_STREAM_NOT_FOUND) throw std::runtime_error("no video stream in " + path);
        if (stream_ < 0 || !codec) throw std::runtime_error("no decoder for the video stream of " + path);
        decoder_.reset(avcodec_alloc_context3(codec));
        if (!decoder_) throw std::runtime_error("out of memory opening " + path);
        code = avcodec_parameters_to_context(decoder_.get(), format->streams[stream_]->codecpar);
        if (code >= 0) code = avcodec_open2(decoder_.get(), codec, nullptr);
        if (code < 0) throw std::runtime_error("cannot open the decoder of " + path + ": " + errorText(code));
        if (decoder_->width < 2 || decoder_->height < 2)
            throw std::runtime_error("unsupported video frame size in " + path);
        width = decoder_->width & ~1;
        height = decoder_->height & ~1;
        frame_.reset(av_frame_alloc());
        packet_.reset(av_packet_alloc());
        if (!frame_ || !packet_) throw std::runtime_error("out of memory opening " + path);
    }

    bool next(std::vector<unsigned char>& frame) override {
        if (!receive()) return false;
        if (frame_->width != decoder_->width || frame_->height != decoder_->height)
            throw std::runtime_error(path_ + ": a frame of " + std::to_string(frame_->width) + "x" +
                                     std::to_string(frame_->height) + " in a video of " +
                                     std::to_string(decoder_->width) + "x" + std::to_string(decoder_->height));
        const AVPixelFormat source = static_cast<AVPixelFormat>(frame_->format);
        // same size both ways: the cropped part is converted, not scaled
        scale_.reset(sws_getCachedContext(scale_.release(), width, height, source, width, height, AV_PIX_FMT_NV21,
                                          SWS_BILINEAR | SWS_ACCURATE_RND, nullptr, nullptr, nullptr));
        if (!scale_) throw std::runtime_error(path_ + ": cannot convert " + pixelFormatName(source) + " to NV21");
        // full-range sources come down to the limited range the camera delivers
        if (frame_->color_range == AVCOL_RANGE_JPEG) {
            int* inverse = nullptr;
            int* table = nullptr;
            int sourceRange = 0, targetRange = 0, brightness = 0, contrast = 0, saturation = 0;
            if (sws_getColorspaceDetails(scale_.get(), &inverse, &sourceRange, &table, &targetRange, &brightness,
                                         &contrast, &saturation) >= 0)
                sws_setColorspaceDetails(scale_.get(), inverse, 1, sws_getCoefficients(SWS_CS_ITU601), 0, brightness,
                                         contrast, saturation);
        }
        frame.resize(static_cast<size_t>(width) * height * 3 / 2);
        uint8_t* planes[4] = {frame.data(), frame.data() + static_cast<size_t>(width) * height, nullptr, nullptr};
        const int strides[4] = {width, width, 0, 0};
        sws_scale(scale_.get(), frame_->data, frame_->linesize, 0, height, planes, strides);
        av_frame_unref(frame_.get());
        return true;
    }

private:
    static std::string pixelFormatName(AVPixelFormat format) {
        const char* name = av_get_pix_fmt_name(format);
        return name ? name : "an unknown pixel format";
    }

    // The next decoded picture into frame_; false when the decoder is drained.
    bool receive() {
        for (;;) {
            const int code = avcodec_receive_frame(decoder_.get(), frame_.get());
            if (code >= 0) return true;
            if (code == AVERROR_EOF) return false;
            if (code != AVERROR(EAGAIN)) throw std::runtime_error(path_ + ": decoding failed: " + errorText(code));
            if (!feed()) return false;
        }
    }

    // One packet of the video stream to the decoder, or the end of the stream; false once
    // the end has been sent.
    bool feed() {
        if (drained_) return false;
        for (;;) {
            const int read = av_read_frame(format_.get(), packet_.get());
            if (read < 0) {
                // the end of the file, or a read error: either way what is buffered comes out
                drained_ = true;
                avcodec_send_packet(decoder_.get(), nullptr);
                return true;
            }
            if (packet_->stream_index != stream_) {
                av_packet_unref(packet_.get());
                continue;
            }
            const int code = avcodec_send_packet(decoder_.get(), packet_.get());
            av_packet_unref(packet_.get());
            // a damaged packet costs its picture, not the rest of the clip
            if (code >= 0 || code == AVERROR_INVALIDDATA) return true;
            throw std::runtime_error(path_ + ": decoding failed: " + errorText(code));
        }
    }

    std::string path_;
    std::unique_ptr<AVFormatContext, FormatCloser> format_;
    std::unique_ptr<AVCodecContext, CodecFreer> decoder_;
    std::unique_ptr<AVFrame, FrameFreer> frame_;
    std::unique_ptr<AVPacket, PacketFreer> packet_;
    std::unique_ptr<SwsContext, ScaleFreer> scale_;
    int stream_ = -1;
    bool drained_ = false;
};

}  // namespace

std::unique_ptr<Clip> openVideo(const std::string& path) { return std::make_unique<VideoClip>(path); }
