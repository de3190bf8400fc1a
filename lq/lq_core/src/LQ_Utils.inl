#pragma once

#include <istream>

namespace LQ {

template <class T>
T fromStr(const std::string& text) {
    std::stringstream ss(text);
    T value{};
    ss >> value;
    // only a failed read counts; text left over is allowed
    LQ_ASSERT_NE(ss.fail(), true);
    return value;
}

template <class T>
std::string toStr(const T& value) {
    std::ostringstream ss;
    ss << value;
    return ss.str();
}

template <class T>
std::string enumValues() {
    std::string text;
    for (int i = 0; i < EnumNames<T>::count(); ++i) {
        if (i) text += ", ";
        text += EnumNames<T>::names()[i];
    }
    return text;
}

template <class T>
const char* enumName(T value) {
    const int index = static_cast<int>(value);
    if (index < 0 || index >= EnumNames<T>::count()) return nullptr;
    return EnumNames<T>::names()[index];
}

template <class T>
std::istream& readEnum(std::istream& stream, T& value) {
    std::string token;
    for (;;) {
        const int c = stream.peek();
        if (c == std::char_traits<char>::eof() || c == '\t' || c == '\n' || c == '\r' || c == ' ' || c == ')' ||
            c == ',')
            break;
        token += static_cast<char>(stream.get());
    }
    for (int i = 0; i < EnumNames<T>::count(); ++i) {
        if (token == EnumNames<T>::names()[i]) {
            value = static_cast<T>(i);
            return stream;
        }
    }
    LQ_FAIL("cannot parse enum " << EnumNames<T>::typeName() << " from `" << token << "`. Use one of "
                                 << enumValues<T>());
    return stream;
}

}  // namespace LQ
