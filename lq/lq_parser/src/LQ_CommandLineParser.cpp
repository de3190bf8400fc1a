#include "LQ_CommandLineParser.h"

#include <cstdlib>
#include <fstream>
#include <iostream>
#include <sstream>

#include "LQ_IniParser.h"

namespace LQ {

namespace {
bool warningsSuppressed = false;

const char* typeWord(int type) {
    switch (type & 15) {
        case ValueType::STRING:
            return "STRING";
        case ValueType::INT:
            return "INT";
        case ValueType::FLOAT:
            return "FLOAT";
        case ValueType::BOOL:
            return "BOOL";
        default:
            return "";
    }
}
}  // namespace

std::vector<std::string> CommandLineParser::replaceImport(const std::vector<std::string>& tokens, int depth) {
    std::vector<std::string> result;
    for (size_t i = 0; i < tokens.size(); ++i) {
        std::string fileName;
        if (tokens[i] == "-i") {
            LQ_ASSERT_MSG(i + 1 < tokens.size(), "no argument to -i");
            fileName = tokens[++i];
        } else if (tokens[i].compare(0, 8, "--import") == 0) {
            std::string key;
            splitKeyValue(tokens[i], key, fileName);
        } else {
            result.push_back(tokens[i]);
            continue;
        }
        std::ifstream file(fileName.c_str());
        LQ_ASSERT_MSG(file.is_open(), "can't open file " << fileName);
        LQ_ASSERT_MSG(depth < maxImportDepth,
                      "imports nest deeper than " << maxImportDepth << " levels at " << fileName);
        const std::vector<std::string> imported = parseStream(file, depth + 1);
        result.insert(result.end(), imported.begin(), imported.end());
    }
    return result;
}

std::vector<std::string> CommandLineParser::fixArgs(const std::vector<std::string>& tokens, int depth) {
    std::vector<std::string> joined;
    for (size_t i = 0; i < tokens.size(); ++i) {
        std::string arg = tokens[i];
        LQ_ASSERT_MSG(!arg.empty(), "empty arg");
        if (arg.find('"') != std::string::npos) {
            while (!(countChars(arg, '"') % 2 == 0 && arg.back() == '"') && i + 1 < tokens.size())
                arg += " " + tokens[++i];
            LQ_ASSERT_MSG(arg.back() == '"', "Closing '\"' isn't found: " << arg);
        } else if (arg.find('{') != std::string::npos) {
            // no nesting: the first token that ends in "}" closes the value
            while (arg.back() != '}' && i + 1 < tokens.size()) arg += " " + tokens[++i];
            LQ_ASSERT_MSG(arg.back() == '}', "Closing } isn't found: " << arg);
        }
        joined.push_back(arg);
    }
    return replaceImport(joined, depth);
}

std::vector<std::string> CommandLineParser::parseStream(std::istream& stream, int depth) {
    std::vector<std::string> tokens;
    std::string token;
    while (stream >> token) {
        if (token[0] == '#') {
            stream.ignore(10000, '\n');
            continue;
        }
        tokens.push_back(token);
    }
    return fixArgs(tokens, depth);
}

std::string getRawValue(const std::string& text) {
    std::string value = text;
    if (!value.empty() && value[0] == '"') {
        LQ_ASSERT_MSG(value.size() >= 2 && value.back() == '"', "no closing \" in " << text);
        value = value.substr(1, value.size() - 2);
    } else if (!value.empty() && value[0] == '{') {
        LQ_ASSERT_MSG(value.size() >= 2 && value.back() == '}', "no closing } in " << text);
        value = value.substr(1, value.size() - 2);
    }
    trim(value, " \t\n");
    return value;
}

void parseString(const std::string& text, std::vector<std::pair<std::string, std::string>>& pairs) {
    std::istringstream stream(text);
    const std::vector<std::string> tokens = CommandLineParser::parseStream(stream);
    for (size_t i = 0; i < tokens.size(); ++i) {
        const std::string& token = tokens[i];
        // a lone "-" names no key either
        LQ_ASSERT_MSG(token[0] == '-' && token.size() > 1, "cannot find key in " << text);
        if (token[1] != '-') {
            std::string value;
            if (i + 1 < tokens.size() && tokens[i + 1][0] != '-') value = getRawValue(tokens[++i]);
            pairs.emplace_back(token.substr(1, 1), value);
        } else {
            const size_t equals = token.find('=');
            const std::string key =
                token.substr(2, equals == std::string::npos ? std::string::npos : equals - 2);
            pairs.emplace_back(
                key, equals == std::string::npos ? std::string() : getRawValue(token.substr(equals + 1)));
        }
    }
}

CommandLineParser::CommandLineParser(const std::string& usageHead, const std::string& usageTail)
    : usageHead_(usageHead), usageTail_(usageTail) {
    add("-h", "--help", "", false, 0, "[Parser] Print help");
    add("-i", "--import", "", false, 1, "[Parser] Load command line parameters from file");
}

void CommandLineParser::add(const std::string& shortKey, const std::string& longKey,
                            const std::string& defaultValue, bool required, int type,
                            const std::string& description) {
    SingleKeyInfo info;
    info.shortKey = shortKey;
    info.longKey = longKey;
    info.type = static_cast<ValueType::Value>(type);
    info.argumentsCount = type == ValueType::NONE ? 0 : 1;
    info.required = required;
    info.description = description;
    info.defaultValue = defaultValue;
    const unsigned int index = static_cast<unsigned int>(keysInfo_.size());
    keysInfo_.push_back(info);
    if (!shortKey.empty()) keyIndex_[shortKey] = index;
    if (!longKey.empty()) keyIndex_[longKey] = index;
    if (required) requiredKeys_[index] = false;
}

unsigned int CommandLineParser::indexOf(const std::string& key, const char* before, const char* after) const {
    const auto found = keyIndex_.find(key);
    LQ_ASSERT_MSG(found != keyIndex_.end(), before << key << after);
    return found->second;
}

void CommandLineParser::setDefaultValue(const std::string& longKey, const std::string& value) {
    keysInfo_[indexOf(longKey, "key ", " is not set")].defaultValue = value;
}

void CommandLineParser::parse(int argc, const char* const* argv) {
    std::vector<std::string> tokens;
    for (int i = 1; i < argc; ++i) tokens.push_back(argv[i]);
    args_ = fixArgs(tokens);
    parseBase(args_);
}

void CommandLineParser::parse(const std::vector<std::string>& tokens) {
    args_ = fixArgs(tokens);
    parseBase(args_);
}

void CommandLineParser::parse(const std::string& text) {
    std::istringstream stream(text);
    args_ = parseStream(stream);
    parseBase(args_);
}

void CommandLineParser::import(const std::string& fileName) {
    std::ifstream file(fileName.c_str());
    LQ_ASSERT_MSG(file.is_open(), "Cannot read file '" << fileName << "'");
    import(file);
}

void CommandLineParser::import(std::istream& stream) {
    parse(parseStream(stream));
}

bool CommandLineParser::findRecognizedKey(const std::vector<std::string>& args, size_t& position) {
    for (; position < args.size(); ++position) {
        const std::string& token = args[position];
        if (keyIndex_.count(token)) return true;
        if (token.find('=') != std::string::npos) return false;
        if (!warningsSuppressed) LQ_LOGW("Unrecognized key: " << token);
        unrecognizedArgs_.push_back(token);
    }
    return false;
}

void CommandLineParser::insertArgument(unsigned int index) {
    values_.insert(std::make_pair(index, std::string()));
    auto required = requiredKeys_.find(index);
    if (required != requiredKeys_.end()) required->second = true;
}

bool CommandLineParser::readArguments(const std::vector<std::string>& args, size_t position,
                                      unsigned int index) {
    for (unsigned int k = 1; k <= keysInfo_[index].argumentsCount; ++k) {
        const std::string& token = args[position + k];
        if (keyIndex_.count(token)) return false;
        values_[index] = token;
    }
    return true;
}

void CommandLineParser::parseBase(const std::vector<std::string>& args) {
    size_t i = 0;
    while (i < args.size()) {
        if (args[i].find('=') == std::string::npos) {
            if (!findRecognizedKey(args, i)) continue;
            const std::string& key = args[i];
            const unsigned int index = keyIndex_[key];
            const SingleKeyInfo& info = keysInfo_[index];
            LQ_ASSERT_MSG(!(info.argumentsCount > 0 && key == info.longKey),
                          "key '" << key << "' is a long key. Please, use '--long-key=value' syntax");
            insertArgument(index);
            LQ_ASSERT_MSG(i + info.argumentsCount < args.size(),
                          "key '" << key << "' has less than required count of arguments");
            LQ_ASSERT_MSG(readArguments(args, i, index),
                          "key '" << key << "' has less than required count of arguments");
            i += 1 + info.argumentsCount;
        } else {
            std::string key, value;
            splitKeyValue(args[i], key, value);
            LQ_ASSERT_MSG(checkLongKey(key), "key '" << key << "' is not a long key");
            const auto found = keyIndex_.find(key);
            if (found != keyIndex_.end()) {
                insertArgument(found->second);
                values_[found->second] = value;
            } else {
                if (!warningsSuppressed) LQ_LOGW("unrecognized key " << key);
                unrecognizedArgs_.push_back(args[i]);
            }
            ++i;
        }
    }
    if (isSet("--help")) {
        printUsage(std::cout);
        std::cout.flush();
        std::exit(0);
    }
    checkRequiredKeysPresence();
}

std::vector<unsigned int> CommandLineParser::isSetAllRequired() const {
    std::vector<unsigned int> missing;
    for (const auto& entry : requiredKeys_)
        if (!entry.second) missing.push_back(entry.first);
    return missing;
}

void CommandLineParser::checkRequiredKeysPresence() const {
    std::string names;
    for (const unsigned int index : isSetAllRequired()) {
        const SingleKeyInfo& info = keysInfo_[index];
        if (!info.shortKey.empty()) names += " '" + info.shortKey + "'";
        if (!info.longKey.empty()) names += " '" + info.longKey + "'";
    }
    LQ_ASSERT_MSG(names.empty(), "some required key(s) missed:" << names);
}

bool CommandLineParser::isSet(const std::string& key) const {
    return values_.count(indexOf(key, "key '", "' doesn't exists")) > 0;
}

std::string CommandLineParser::getString(const std::string& key) const {
    const unsigned int index = indexOf(key, "unknown key '", "'");
    const auto value = values_.find(index);
    if (value == values_.end()) return keysInfo_[index].defaultValue;
    return getRawValue(value->second);
}

bool CommandLineParser::isNumeric(const std::string& text, bool allowPoint) {
    if (text.empty()) return false;
    for (size_t i = text[0] == '-' ? 1 : 0; i < text.size(); ++i) {
        const char c = text[i];
        if (!((c >= '0' && c <= '9') || (allowPoint && c == '.'))) return false;
    }
    return true;
}

int CommandLineParser::getInt(const std::string& key) const {
    const std::string value = getString(key);
    LQ_ASSERT_MSG(isNumeric(value, false), "value for " << key << ": type of '" << value << "' is not Int");
    return get<int>(key);
}

float CommandLineParser::getFloat(const std::string& key) const {
    const std::string value = getString(key);
    LQ_ASSERT_MSG(isNumeric(value, true), "value for " << key << ": type of '" << value << "' is not Float");
    return get<float>(key);
}

bool CommandLineParser::getBool(const std::string& key) const {
    const std::string value = getString(key);
    if (value == "true" || value == "yes" || value == "1") return true;
    if (value == "false" || value == "no" || value == "0") return false;
    LQ_FAIL("convert error for the key '" << key << "'");
}

std::map<std::string, std::string> CommandLineParser::getArgs() const {
    std::map<std::string, std::string> result;
    for (const auto& entry : keyIndex_) {
        if (entry.first.find("--") == std::string::npos) continue;
        const auto value = values_.find(entry.second);
        if (value != values_.end()) result[entry.first] = value->second;
    }
    return result;
}

std::string CommandLineParser::getArgsString() const {
    std::string text;
    for (const auto& entry : getArgs()) text += entry.first + "=\"" + entry.second + "\" ";
    return text;
}

std::string CommandLineParser::getAllArgsStr() const {
    std::string text;
    for (const std::string& arg : args_) text += arg + " ";
    return text;
}

void CommandLineParser::printUsage(std::ostream& out) const {
    out << usageHead_ << "\n\n";
    for (const SingleKeyInfo& info : keysInfo_) {
        out << " ";
        const std::string word =
            !info.defaultValue.empty() ? info.defaultValue : (info.argumentsCount ? typeWord(info.type) : "");
        if (!info.shortKey.empty()) {
            out << info.shortKey;
            if (!word.empty()) out << " " << word;
        }
        if (!info.shortKey.empty() && !info.longKey.empty()) out << ", ";
        if (!info.longKey.empty()) {
            out << info.longKey;
            if (!word.empty()) out << "=" << word;
        }
        if (info.required) out << "    [required]";
        out << "\n";
        std::istringstream lines(info.description);
        std::string line;
        while (std::getline(lines, line)) out << "   " << line << "\n";
        out << " \n";
    }
    out << usageTail_ << "\n\n";
}

void CommandLineParser::reset() {
    values_.clear();
    unrecognizedArgs_.clear();
    for (auto& entry : requiredKeys_) entry.second = false;
}

void CommandLineParser::suppressWarnings() {
    warningsSuppressed = true;
}

bool CommandLineParser::checkShortKey(const std::string& key) {
    return key.size() == 2 && key[0] == '-';
}

bool CommandLineParser::checkLongKey(const std::string& key) {
    return key.size() >= 4 && key.compare(0, 2, "--") == 0;
}

}  // namespace LQ
