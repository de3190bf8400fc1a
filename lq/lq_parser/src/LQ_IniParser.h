#pragma once
// A two-level table of text settings, sections of keys with values, read from and
// written to an INI text form. Its key-value splitter also serves the option parser.

#include <istream>
#include <map>
#include <ostream>
#include <string>
#include <vector>

namespace LQ {

class IniParser {
public:
    explicit IniParser(char commentChar = '#');

    // 0 on success, the number of the first bad line (from 1), -1 if the file can't be read.
    // The table isn't cleared first, so files merge key by key.
    int load(const std::string& fileName);
    int load(std::istream& stream);
    bool save(const std::string& fileName) const;
    bool save(std::ostream& stream) const;

    // A full key is section, "/", key; with no "/" it belongs to the unnamed section.
    void setKey(const std::string& fullKey, const std::string& value);
    // creates nothing
    std::string getKey(const std::string& fullKey, const std::string& defaultValue) const;
    bool hasKey(const std::string& fullKey) const;
    bool hasKey(const std::string& section, const std::string& key) const;
    // all full names in table order; a key of the unnamed section stands bare
    void getAllKeys(std::vector<std::string>& keys) const;
    void reset();
    void splitFullKey(const std::string& fullKey, std::string& section, std::string& key) const;

private:
    // 0, or lineNumber when the line is bad
    int parseCurrentLine(const std::string& line, int lineNumber, std::string& currentSection);

    char sectionSeparator_;
    char commentChar_;
    std::map<std::string, std::map<std::string, std::string>> sections_;
};

// the line up to the first comment character
std::string cleanFromComments(const std::string& line, char commentChar);
// blanks and tabs from both ends
std::string trim(const std::string& line);
// "[name]" with a non-empty name free of blanks, tabs, "=", "[" and "]"
bool getSectionName(const std::string& line, std::string& name);
// Splits at the first "="; both parts are filled in even when the result is false. A
// value in double quotes loses them and must close them.
bool splitKeyValue(const std::string& line, std::string& key, std::string& value);
// at least two characters, none of " \t-=[]"
bool isKeyCorrect(const std::string& key);
bool isValueCorrect(const std::string& value);
// "[error] ", the text and a newline on the standard error stream
void writeError(const std::string& text);

}  // namespace LQ
