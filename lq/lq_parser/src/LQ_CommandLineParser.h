#pragma once
// Declared keys, one text of long options in, typed values out. Engines take their
// options through it; it also reads argc/argv, token lists and option files.

#include <istream>
#include <map>
#include <ostream>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "LQ_Utils.h"

namespace LQ {

struct ValueType {
    // a plain int underneath: callers pass the type as a number and only its low bits count
    enum Value : int { NONE = 0, STRING = 1, INT = 2, FLOAT = 3, BOOL = 4 };
};

struct SingleKeyInfo {
    std::string shortKey;
    std::string longKey;
    unsigned int argumentsCount = 0;
    bool required = false;
    std::string description;
    std::string defaultValue;
    ValueType::Value type = ValueType::NONE;
};

class CommandLineParser {
public:
    CommandLineParser(const std::string& usageHead = std::string(),
                      const std::string& usageTail = std::string());

    // type: a ValueType value; 0 takes no argument
    void add(const std::string& shortKey, const std::string& longKey, const std::string& defaultValue,
             bool required, int type, const std::string& description);
    void setDefaultValue(const std::string& longKey, const std::string& value);

    // Each parse keeps its fixed argument list and adds to the values of earlier ones.
    // "--help" prints the usage to stdout and ends the process with status 0; otherwise a
    // required key that was never seen fails. argv[0] is the program and is skipped.
    void parse(int argc, const char* const* argv);
    void parse(const std::vector<std::string>& tokens);
    void parse(const std::string& text);
    void import(const std::string& fileName);
    void import(std::istream& stream);

    bool isSet(const std::string& key) const;
    std::string getString(const std::string& key) const;
    int getInt(const std::string& key) const;
    float getFloat(const std::string& key) const;
    bool getBool(const std::string& key) const;
    template <class T>
    T get(const std::string& key) const {
        std::istringstream stream(getString(key));
        T value{};
        stream >> value;
        return value;
    }

    // the set keys by their long spelling, dashes included
    std::map<std::string, std::string> getArgs() const;
    std::string getArgsString() const;
    const std::vector<std::string>& getAllArgs() const { return args_; }
    std::string getAllArgsStr() const;
    const std::vector<std::string>& getUnrecognizedArgs() const { return unrecognizedArgs_; }
    const std::vector<SingleKeyInfo>& keysInfo() const { return keysInfo_; }

    void printUsage(std::ostream& out) const;
    // forgets the values; the declarations and the last argument list stay
    void reset();
    static void suppressWarnings();

    static bool checkShortKey(const std::string& key);
    static bool checkLongKey(const std::string& key);

    // Tokens of a text, split at white space; a token that starts with "#" drops the rest
    // of its line. The tokens then go through fixArgs. depth counts nested imports.
    static std::vector<std::string> parseStream(std::istream& stream, int depth = 0);
    // Joins a quoted or braced value that blanks cut into several tokens, then resolves
    // the imports.
    static std::vector<std::string> fixArgs(const std::vector<std::string>& tokens, int depth = 0);
    // "-i name" and "--import=name" replaced by the tokens of the file.
    static std::vector<std::string> replaceImport(const std::vector<std::string>& tokens, int depth = 0);
    // nested imports beyond this fail: a file that imports itself would never end
    static constexpr int maxImportDepth = 16;

private:
    void parseBase(const std::vector<std::string>& args);
    // Scans forward to a declared key; false at a "key=value" token or the end.
    bool findRecognizedKey(const std::vector<std::string>& args, size_t& position);
    // The tokens behind the key at position into its value; false at a declared key.
    bool readArguments(const std::vector<std::string>& args, size_t position, unsigned int index);
    void insertArgument(unsigned int index);
    // indices of the required keys not seen, in index order
    std::vector<unsigned int> isSetAllRequired() const;
    void checkRequiredKeysPresence() const;
    static bool isNumeric(const std::string& text, bool allowPoint);
    unsigned int indexOf(const std::string& key, const char* before, const char* after) const;

    std::string usageHead_;
    std::string usageTail_;
    std::vector<std::string> args_;
    std::map<std::string, unsigned int> keyIndex_;
    std::vector<SingleKeyInfo> keysInfo_;
    std::map<unsigned int, bool> requiredKeys_;
    std::map<unsigned int, std::string> values_;
    std::vector<std::string> unrecognizedArgs_;
};

// the text without enclosing double quotes or braces, trimmed
std::string getRawValue(const std::string& text);
// a stand-alone tokeniser into (key, value) pairs, with no declared keys
void parseString(const std::string& text, std::vector<std::pair<std::string, std::string>>& pairs);

}  // namespace LQ
