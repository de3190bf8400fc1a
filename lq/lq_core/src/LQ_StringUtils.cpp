#include "LQ_StringUtils.h"

#include <algorithm>
#include <cctype>

#include "LQ_Utils.h"

namespace LQ {

std::vector<std::string> split(const std::string& text, char delimiter) {
    std::vector<std::string> parts;
    size_t start = 0;
    while (start <= text.size()) {
        size_t end = text.find(delimiter, start);
        if (end == std::string::npos) end = text.size();
        if (end > start) parts.push_back(text.substr(start, end - start));
        start = end + 1;
    }
    return parts;
}

std::string replaceChar(const std::string& text, char from, char to) {
    std::string result = text;
    std::replace(result.begin(), result.end(), from, to);
    return result;
}

std::string replaceString(const std::string& text, const std::string& from, const std::string& to) {
    LQ_ASSERT_MSG(!from.empty(), "replace from empty sting");
    std::string result = text;
    size_t position = 0;
    while ((position = result.find(from, position)) != std::string::npos) {
        result.replace(position, from.size(), to);
        position += to.size();
    }
    return result;
}

std::string toLowerCase(const std::string& text) {
    std::string result = text;
    for (char& c : result) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return result;
}

void trim(std::string& text, const std::string& characters) {
    const size_t first = text.find_first_not_of(characters);
    if (first != std::string::npos) {
        const size_t last = text.find_last_not_of(characters);
        text = text.substr(first, last - first + 1);
    }
    if (text.size() >= 2 && text.front() == '"' && text.back() == '"') text = text.substr(1, text.size() - 2);
}

int countChars(const std::string& text, char character) {
    return static_cast<int>(std::count(text.begin(), text.end(), character));
}

bool compareStringsNumeric(const std::string& a, const std::string& b) {
    if (a.size() != b.size()) return a.size() < b.size();
    return a < b;
}

void numericSort(std::vector<std::string>& list) {
    std::sort(list.begin(), list.end(), compareStringsNumeric);
}

std::string toBits(unsigned int value) {
    const int bits = value < 256 ? 8 : 32;
    std::string text;
    for (int bit = bits - 1; bit >= 0; --bit) {
        text += (value >> bit) & 1u ? '1' : '0';
        if (bit && bit % 8 == 0) text += ' ';
    }
    return text;
}

float radianToDegree(float radian) {
    if (radian < 0.f) radian += 6.2831855f;
    return radian * 180.f / 3.1415927f;
}

float degreeToRadian(float degree) {
    if (degree < 0.f) degree += 360.f;
    return degree * 3.1415927f / 180.f;
}

}  // namespace LQ
