#include "LQ_IniParser.h"

#include <fstream>
#include <iostream>

#include "LQ_Utils.h"

namespace LQ {

IniParser::IniParser(char commentChar) : sectionSeparator_('/'), commentChar_(commentChar) {}

int IniParser::load(const std::string& fileName) {
    std::ifstream file(fileName.c_str());
    if (!file.is_open()) {
        writeError("Cannot read file '" + fileName + "'");
        return -1;
    }
    return load(file);
}

int IniParser::load(std::istream& stream) {
    std::string currentSection;
    std::string line;
    int lineNumber = 0;
    while (std::getline(stream, line)) {
        ++lineNumber;
        line = trim(cleanFromComments(line, commentChar_));
        if (line.empty()) continue;
        const int failedLine = parseCurrentLine(line, lineNumber, currentSection);
        if (failedLine) return failedLine;
    }
    return 0;
}

int IniParser::parseCurrentLine(const std::string& line, int lineNumber, std::string& currentSection) {
    if (line[0] == '[') {
        std::string name;
        if (!getSectionName(line, name)) {
            writeError("Incorrect section name: '" + line + "'");
            return lineNumber;
        }
        currentSection = name;
        return 0;
    }
    std::string key, value;
    if (!splitKeyValue(line, key, value)) {
        writeError("Incorrect 'key-value' pair: '" + line + "'");
        return lineNumber;
    }
    setKey(currentSection + sectionSeparator_ + key, value);
    return 0;
}

bool IniParser::save(const std::string& fileName) const {
    std::ofstream file(fileName.c_str());
    if (!file.is_open()) return false;
    return save(file);
}

bool IniParser::save(std::ostream& stream) const {
    for (const auto& section : sections_) {
        const bool named = !section.first.empty();
        if (named) stream << "\n[" << section.first << "]\n";
        for (const auto& entry : section.second)
            stream << (named ? "  " : "") << entry.first << " = " << entry.second << "\n";
    }
    return true;
}

void IniParser::setKey(const std::string& fullKey, const std::string& value) {
    std::string section, key;
    splitFullKey(fullKey, section, key);
    sections_[section][key] = value;
}

std::string IniParser::getKey(const std::string& fullKey, const std::string& defaultValue) const {
    std::string section, key;
    splitFullKey(fullKey, section, key);
    const auto found = sections_.find(section);
    if (found == sections_.end()) return defaultValue;
    const auto entry = found->second.find(key);
    return entry == found->second.end() ? defaultValue : entry->second;
}

bool IniParser::hasKey(const std::string& fullKey) const {
    std::string section, key;
    splitFullKey(fullKey, section, key);
    return hasKey(section, key);
}

bool IniParser::hasKey(const std::string& section, const std::string& key) const {
    const auto found = sections_.find(section);
    return found != sections_.end() && found->second.count(key) > 0;
}

void IniParser::getAllKeys(std::vector<std::string>& keys) const {
    keys.clear();
    for (const auto& section : sections_) {
        for (const auto& entry : section.second)
            keys.push_back(section.first.empty() ? entry.first
                                                 : section.first + sectionSeparator_ + entry.first);
    }
}

void IniParser::reset() {
    sections_.clear();
}

void IniParser::splitFullKey(const std::string& fullKey, std::string& section, std::string& key) const {
    const size_t separator = fullKey.find(sectionSeparator_);
    if (separator == std::string::npos) {
        section.clear();
        key = fullKey;
    } else {
        section = fullKey.substr(0, separator);
        key = fullKey.substr(separator + 1);
    }
}

std::string cleanFromComments(const std::string& line, char commentChar) {
    return line.substr(0, line.find(commentChar));
}

std::string trim(const std::string& line) {
    const size_t first = line.find_first_not_of(" \t");
    if (first == std::string::npos) return std::string();
    const size_t last = line.find_last_not_of(" \t");
    return line.substr(first, last - first + 1);
}

bool getSectionName(const std::string& line, std::string& name) {
    if (line.size() < 2 || line.front() != '[' || line.back() != ']') return false;
    name = line.substr(1, line.size() - 2);
    return !name.empty() && name.find_first_of(" \t=[]") == std::string::npos;
}

bool isKeyCorrect(const std::string& key) {
    return key.size() > 1 && key.find_first_of(" \t-=[]") == std::string::npos;
}

bool isValueCorrect(const std::string& value) {
    return value.find('=') == std::string::npos;
}

bool splitKeyValue(const std::string& line, std::string& key, std::string& value) {
    const size_t equals = line.find('=');
    if (equals == std::string::npos) {
        writeError("No '=' found in line '" + line + "'");
        return false;
    }
    key = trim(line.substr(0, equals));
    value = trim(line.substr(equals + 1));
    if (!value.empty() && value[0] == '"') {
        value.erase(0, 1);
        LQ_ASSERT_MSG(!value.empty() && value.back() == '"',
                      "Closing quote is missing in the end of value: " << value);
        value.pop_back();
    }
    return isKeyCorrect(key) && isValueCorrect(value);
}

void writeError(const std::string& text) {
    std::cerr << "[error] " << text << "\n";
}

}  // namespace LQ
