#include "frame_json.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>

namespace {

// The length of the well-formed UTF-8 sequence at text, 0 if there is none: overlong
// forms, surrogates and code points past U+10FFFF are not UTF-8.
size_t utf8Length(const unsigned char* text, size_t left) {
    const unsigned lead = text[0];
    size_t length;
    unsigned codePoint, smallest;
    if (lead < 0x80) return 1;
    if ((lead & 0xe0) == 0xc0) {
        length = 2, codePoint = lead & 0x1f, smallest = 0x80;
    } else if ((lead & 0xf0) == 0xe0) {
        length = 3, codePoint = lead & 0x0f, smallest = 0x800;
    } else if ((lead & 0xf8) == 0xf0) {
        length = 4, codePoint = lead & 0x07, smallest = 0x10000;
    } else {
        return 0;
    }
    if (length > left) return 0;
    for (size_t i = 1; i < length; ++i) {
        if ((text[i] & 0xc0) != 0x80) return 0;
        codePoint = codePoint << 6 | (text[i] & 0x3f);
    }
    if (codePoint < smallest || codePoint > 0x10ffff || (codePoint >= 0xd800 && codePoint <= 0xdfff)) return 0;
    return length;
}

template <size_t N>
void writeArray(std::string& out, const char* name, const std::array<float, N>& values) {
    out += ",\"";
    out += name;
    out += "\":[";
    for (size_t i = 0; i < N; ++i) {
        if (i) out += ',';
        out += jsonNumber(values[i]);
    }
    out += ']';
}

}  // namespace

std::string jsonString(std::string_view text) {
    std::string out = "\"";
    const auto* bytes = reinterpret_cast<const unsigned char*>(text.data());
    for (size_t i = 0; i < text.size();) {
        const unsigned char c = bytes[i];
        const size_t length = utf8Length(bytes + i, text.size() - i);
        if (length == 0) {
            out += "\\ufffd";
            ++i;
            continue;
        }
        if (c == '"' || c == '\\') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c == '\n') {
            out += "\\n";
        } else if (c == '\r') {
            out += "\\r";
        } else if (c == '\t') {
            out += "\\t";
        } else if (c < 0x20) {
            char escaped[8];
            std::snprintf(escaped, sizeof(escaped), "\\u%04x", c);
            out += escaped;
        } else {
            out.append(text.data() + i, length);
        }
        i += length;
    }
    return out + "\"";
}

std::string jsonNumber(float value) {
    if (!std::isfinite(value)) return "null";
    char text[32];
    // nine significant digits always read back; fewer are tried first so 0.1f stays "0.1"
    for (int digits = 6; digits <= 9; ++digits) {
        std::snprintf(text, sizeof(text), "%.*g", digits, static_cast<double>(value));
        if (std::strtof(text, nullptr) == value) break;
    }
    return text;
}

std::string frameJson(int frameIndex, const std::vector<GestureResult>& results) {
    std::string out = "{\"frame\":" + std::to_string(frameIndex) + ",\"gestures\":[";
    for (size_t i = 0; i < results.size(); ++i) {
        const GestureResult& result = results[i];
        if (i) out += ',';
        out += "{\"gesture\":" + jsonString(result.gesture);
        if (result.rect) writeArray(out, "rect", *result.rect);
        if (result.angle) out += ",\"angle\":" + jsonNumber(*result.angle);
        if (result.point) writeArray(out, "point", *result.point);
        if (result.point3d) writeArray(out, "point3d", *result.point3d);
        std::string others;
        for (const auto& [key, value] : result.parameters) {
            if (value.empty()) continue;
            if (key == "text" || key == "side" || key == "key-ring") {
                out += ',' + jsonString(key) + ':' + jsonString(value);
            } else {
                others += (others.empty() ? "" : ",") + jsonString(key) + ':' + jsonString(value);
            }
        }
        if (!others.empty()) out += ",\"parameters\":{" + others + '}';
        out += '}';
    }
    return out + "]}";
}

std::string frameErrorJson(int frameIndex, std::string_view error) {
    return "{\"frame\":" + std::to_string(frameIndex) + ",\"error\":" + jsonString(error) + "}";
}
