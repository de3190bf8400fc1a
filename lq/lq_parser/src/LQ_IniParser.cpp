#include "LQ_IniParser.h"

#include <iostream>

#include "LQ_Utils.h"

namespace LQ {

void writeError(const std::string& text) { std::cerr << "[error] " << text << "\n"; }

std::string trim(const std::string& line) {
    const size_t first = line.find_first_not_of(" \t");
    if (first == std::string::npos) return std::string();
    const size_t last = line.find_last_not_of(" \t");
    return line.substr(first, last - first + 1);
}

bool isKeyCorrect(const std::string& key) { return key.size() > 1 && key.find_first_of(" \t-=[]") == std::string::npos; }

bool isValueCorrect(const std::string& value) { return value.find('=') == std::string::npos; }

bool splitKeyValue(const std::string& line, std::string& key, std::string& value) {
    const size_t equals = line.find('=');
    if (equals == std::string::npos) {
        writeError("No '=' found in line '" + line + "'");
        return false;
    }
    key = trim(line.substr(0, equals));
    value = trim(line.substr(equals + 1));
    if (!value.empty() && value[0] == '"') {
        value = value.substr(1);
        LQ_ASSERT_MSG(!value.empty() && value.back() == '"', "Closing quote is missing in the end of value: " << value);
        value.pop_back();
    }
    return isKeyCorrect(key) && isValueCorrect(value);
}

}  // namespace LQ
