#include "Blob.h"

#include <cmath>
#include <cstdlib>
#include <cstring>
#include <sstream>
#include <iomanip>
#include <map>

#include "LQ_Utils.h"

namespace {
constexpr int MAX_BUFFER_SIZE = 256;

// a label of the text form, read byte for byte
void readLabel(std::istream& stream, const std::string& label) {
    const int size = static_cast<int>(label.size());
    LQ_ASSERT_MSG(size < MAX_BUFFER_SIZE, "wrong str size " << size << " >= " << MAX_BUFFER_SIZE);
    char buffer[MAX_BUFFER_SIZE] = {};
    stream.read(buffer, size);
    LQ_ASSERT_MSG((label == buffer) && (std::istream&)(stream), "cannot read \"" << label << "\" from \"" << buffer
                                                                                  << "\"");
}

// a label, one separator, the number, one separator
int readField(std::istream& stream, const std::string& label) {
    readLabel(stream, label);
    stream.get();
    int value = 0;
    stream >> value;
    stream.get();
    return value;
}
}  // namespace

Blob& Blob::operator=(const Blob& blob) {
    LQ_ASSERT_MSG(this != &blob, "this == &blob");
    data_ = blob.data_;
    num_ = blob.num_;
    channels_ = blob.channels_;
    height_ = blob.height_;
    width_ = blob.width_;
    memory_ = blob.memory_;
    return *this;
}

void Blob::init(int num, int channels, int height, int width) {
    if (num == num_ && channels == channels_ && height == height_ && width == width_) return;
    const long long count = static_cast<long long>(num) * channels * height * width;
    LQ_ASSERT_MSG(num >= 0 && channels >= 0 && height >= 0 && width >= 0 && count <= MAX_SIZE,
                  "bad blob shape " << num << " x " << channels << " x " << width << " x " << height);
    if (count != size()) {
        memory_ = count ? LQ::SharedArray<float>(new float[count]) : LQ::SharedArray<float>();
        data_ = memory_.get();
    }
    num_ = num;
    channels_ = channels;
    height_ = height;
    width_ = width;
}

void Blob::init(int num, int channels, int height, int width, const LQ::SharedArray<float>& memory) {
    num_ = num;
    channels_ = channels;
    height_ = height;
    width_ = width;
    memory_ = memory;
    data_ = memory_.get();
}

void Blob::init(int num, int channels, int height, int width, const float* data) {
    init(num, channels, height, width, LQ::SharedArray<float>(const_cast<float*>(data), false));
}

void Blob::reset() {
    num_ = channels_ = height_ = width_ = 0;
    memory_ = LQ::SharedArray<float>();
    data_ = nullptr;
}

bool Blob::operator==(const Blob& blob) const {
    if (num_ != blob.num_ || channels_ != blob.channels_ || height_ != blob.height_ || width_ != blob.width_)
        return false;
    return size() == 0 || std::memcmp(data_, blob.data_, static_cast<size_t>(size()) * sizeof(float)) == 0;
}

Blob::operator std::vector<float>() const { return std::vector<float>(data_, data_ + size()); }

void Blob::zeroSmallValues(float threshold) {
    float* p = data_;
    const int n = size();
    for (int i = 0; i < n; ++i) p[i] = std::fabs(p[i]) < threshold ? 0.f : p[i];
}

void Blob::convert(const LQ::Image& image, Blob& blob, int num, int maxNum) {
    LQ_ASSERT_GE(num, 0);
    LQ_ASSERT_GE(maxNum, num);
    const int W = image.width(), H = image.height(), D = image.depth();
    blob.init(maxNum, D, H, W);
    for (int k = 0; k < D; ++k) {
        float* plane = blob.data(num, k, 0, 0);
        for (int y = 0; y < H; ++y) {
            const unsigned char* row = image.data() + static_cast<size_t>(y) * image.stripLength();
            float* out = plane + y * W;
            for (int x = 0; x < W; ++x) out[x] = row[x * D + k] * 0.00390625f;
        }
    }
}

void Blob::convert(const std::vector<float>& values, Blob& blob) {
    blob.init(1, static_cast<int>(values.size()), 1, 1);
    if (!values.empty()) std::memcpy(blob.data(), values.data(), values.size() * sizeof(float));
}

std::string Blob::shape() const {
    return LQ::toStr(num_) + " x " + LQ::toStr(channels_) + " x " + LQ::toStr(width_) + " x " + LQ::toStr(height_);
}

void Blob::printDistribution() const {
    std::map<int, int> counts;
    for (int i = 0; i < size(); ++i) ++counts[static_cast<int>(std::lround(data_[i] * 100))];
    std::ostringstream text;
    text << "map[" << counts.size() << "](";
    bool first = true;
    for (const auto& entry : counts) {
        text << (first ? "" : ", ") << entry.first << " = " << entry.second;
        first = false;
    }
    text << ")";
    LQ_LOGI("distribution" << " = " << text.str() << "\n");
}

std::string floatLiteral(float value) {
    std::string text;
    // the stream's default form, with digits added only where six don't read back
    for (int precision = 6; precision <= 9; ++precision) {
        std::ostringstream out;
        out.precision(precision);
        out << value;
        text = out.str();
        if (std::strtof(text.c_str(), nullptr) == value) break;
    }
    const bool decimal = text.find('.') != std::string::npos || text.find('e') != std::string::npos;
    return text + (decimal ? "f" : ".f");
}

void Blob::saveToCpp(std::ostream& stream, const std::string& name) const {
    stream << "Blob& " << name << "()\n"
           << "{\n"
           << "    // num = " << num_ << "\n"
           << "    // channels = " << channels_ << "\n"
           << "    // width = " << width_ << "\n"
           << "    // height = " << height_ << "\n"
           << "    static const float " << name << "_data[] = \n"
           << "    {\n"
           << "       ";
    const int n = size();
    for (int i = 0; i < n; ++i) {
        stream << floatLiteral(data_[i]);
        if (i + 1 < n) stream << ", ";
        if (i % 10 == 9) stream << "\n       ";
    }
    stream << "\n"
           << "    };\n"
           << "    static Blob blob;\n"
           << "    blob.init(" << num_ << ", " << channels_ << ", " << height_ << ", " << width_ << ", " << name
           << "_data);\n"
           << "    return blob;\n"
           << "}\n\n";
}

std::ostream& operator<<(std::ostream& stream, const Blob& blob) {
    stream << "Blob\n";
    stream << "num= " << blob.num() << "\n";
    stream << "channels= " << blob.channels() << "\n";
    stream << "width= " << blob.width() << "\n";
    stream << "height= " << blob.height() << "\n";
    for (int n = 0; n < blob.num(); ++n) {
        stream << "n= " << n << "\n";
        for (int c = 0; c < blob.channels(); ++c) {
            stream << "\tc= " << c << "\n";
            for (int y = 0; y < blob.height(); ++y) {
                stream << "\t\t";
                const float* row = blob.data(n, c, y, 0);
                for (int x = 0; x < blob.width(); ++x) stream << std::setw(12) << std::setfill(' ') << row[x] << ' ';
                stream << "\n";
            }
        }
    }
    return stream;
}

std::istream& operator>>(std::istream& stream, Blob& blob) {
    readLabel(stream, "Blob");
    stream.get();
    const int num = readField(stream, "num=");
    const int channels = readField(stream, "channels=");
    const int width = readField(stream, "width=");
    const int height = readField(stream, "height=");
    blob.init(num, channels, height, width);
    for (int n = 0; n < num; ++n) {
        const int bn = readField(stream, "n=");
        LQ_ASSERT_EQ(bn, n);
        for (int c = 0; c < channels; ++c) {
            stream.get();  // tab
            const int bc = readField(stream, "c=");
            LQ_ASSERT_EQ(bc, c);
            for (int y = 0; y < height; ++y) {
                stream.get();
                stream.get();
                float* row = blob.data(n, c, y, 0);
                for (int x = 0; x < width; ++x) {
                    stream >> row[x];
                    stream.get();
                }
                stream.get();  // line end
            }
        }
    }
    return stream;
}

LQ::ArchiveO& operator&(LQ::ArchiveO& archive, const Blob& blob) {
    const int32_t shape[4] = {blob.num(), blob.channels(), blob.height(), blob.width()};
    archive & shape[0] & shape[1] & shape[2] & shape[3];
    if (blob.size()) archive.write(blob.data(), static_cast<unsigned int>(blob.size()));
    return archive;
}

namespace {
// bytes left in a stream that can tell, or -1
long long remainingBytes(std::istream& stream) {
    const std::streampos here = stream.tellg();
    if (here < 0) return -1;
    stream.seekg(0, std::ios::end);
    const std::streampos end = stream.tellg();
    stream.seekg(here);
    return end < 0 ? -1 : static_cast<long long>(end - here);
}
}  // namespace

LQ::ArchiveI& operator&(LQ::ArchiveI& archive, Blob& blob) {
    int32_t num = 0, channels = 0, height = 0, width = 0;
    archive & num & channels & height & width;
    std::istream& stream = archive;
    LQ_ASSERT_MSG(stream, "blob shape cut short");
    // a corrupt shape must not allocate more than the file can hold
    const long long count = static_cast<long long>(num) * channels * height * width;
    const long long left = remainingBytes(stream);
    LQ_ASSERT_MSG(left < 0 || count * 4 <= left,
                  "blob of " << num << " x " << channels << " x " << width << " x " << height << " needs "
                             << count * 4 << " bytes, the file has " << left);
    blob.init(num, channels, height, width);
    if (blob.size()) archive.read(blob.data(), static_cast<unsigned int>(blob.size()));
    LQ_ASSERT_MSG(static_cast<std::istream&>(archive), "blob values cut short: " << blob.shape());
    blob.zeroSmallValues(1e-10f);
    return archive;
}
