#pragma once
// The pieces of the INI form that the option parser shares: key-value splitting and the
// error line.

#include <string>

namespace LQ {

// "[error] ", the text and a newline on the standard error stream
void writeError(const std::string& text);
// blanks and tabs from both ends
std::string trim(const std::string& line);
bool isKeyCorrect(const std::string& key);
bool isValueCorrect(const std::string& value);
// Splits at the first "="; both parts are filled in even when the result is false. A
// value in double quotes loses them.
bool splitKeyValue(const std::string& line, std::string& key, std::string& value);

}  // namespace LQ
