// Image folders, decoded by OpenCV's imgcodecs.
#include <algorithm>
#include <cctype>
#include <filesystem>
#include <set>
#include <stdexcept>

#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>

#include "clips.h"

namespace fs = std::filesystem;

namespace {

bool isImageFile(const fs::path& path) {
    static const std::set<std::string> extensions = {".png", ".jpg", ".jpeg", ".jpe", ".ppm", ".pgm", ".pbm",
                                                     ".pnm", ".bmp", ".dib", ".tif", ".tiff", ".webp"};
    std::string extension = path.extension().string();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    return extensions.count(extension) > 0;
}

class ImageFolderClip : public Clip {
public:
    explicit ImageFolderClip(const std::string& directory) {
        std::error_code error;
        for (fs::directory_iterator it(directory, error), end; !error && it != end; it.increment(error))
            if (it->is_regular_file() && isImageFile(it->path())) files_.push_back(it->path().string());
        if (error) throw std::runtime_error("cannot read the folder " + directory + ": " + error.message());
        if (files_.empty()) throw std::runtime_error("no image files in " + directory);
        std::sort(files_.begin(), files_.end());
        // the first image sets the clip's size, so it is decoded here and kept for next()
        decode(files_[0], first_);
        firstWidth_ = first_.cols;
        firstHeight_ = first_.rows;
        if (firstWidth_ < 2 || firstHeight_ < 2)
            throw std::runtime_error(files_[0] + " is too small: " + sizeText(first_));
        width = firstWidth_ & ~1;
        height = firstHeight_ & ~1;
    }

    bool next(std::vector<unsigned char>& frame) override {
        if (index_ >= files_.size()) return false;
        cv::Mat image;
        if (index_ == 0) {
            image = first_;
            first_.release();
        } else {
            decode(files_[index_], image);
            if (image.cols != firstWidth_ || image.rows != firstHeight_)
                throw std::runtime_error(files_[index_] + " is " + sizeText(image) + ", the first image " +
                                         files_[0] + " is " + std::to_string(firstWidth_) + "x" +
                                         std::to_string(firstHeight_));
        }
        frame.resize(static_cast<size_t>(width) * height * 3 / 2);
        rgbToNv21(image.data, image.step[0], image.cols, image.rows, frame.data());
        ++index_;
        return true;
    }

private:
    static std::string sizeText(const cv::Mat& image) {
        return std::to_string(image.cols) + "x" + std::to_string(image.rows);
    }
    static void decode(const std::string& path, cv::Mat& rgb) {
        // 16-bit, grey and alpha images all come out as 8-bit BGR
        const cv::Mat bgr = cv::imread(path, cv::IMREAD_COLOR);
        if (bgr.empty()) throw std::runtime_error("cannot decode the image " + path);
        cv::cvtColor(bgr, rgb, cv::COLOR_BGR2RGB);
    }

    std::vector<std::string> files_;
    size_t index_ = 0;
    cv::Mat first_;
    int firstWidth_ = 0, firstHeight_ = 0;
};

}  // namespace

std::unique_ptr<Clip> openImageFolder(const std::string& directory) {
    return std::make_unique<ImageFolderClip>(directory);
}
