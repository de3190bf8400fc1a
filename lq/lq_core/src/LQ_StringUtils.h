#pragma once
// Small text helpers and angle units. None of them keeps state.

#include <string>
#include <vector>

namespace LQ {

// the parts between delimiters; empty parts are dropped
std::vector<std::string> split(const std::string& text, char delimiter);
std::string replaceChar(const std::string& text, char from, char to);
// Every occurrence of from, searched left to right; the search goes on behind each
// replacement, so a to that holds from doesn't repeat. from must not be empty.
std::string replaceString(const std::string& text, const std::string& from, const std::string& to);
std::string toLowerCase(const std::string& text);
// Cuts the characters of the set from both ends (a text made only of them stays as it
// is), then one pair of enclosing double quotes.
void trim(std::string& text, const std::string& characters);
int countChars(const std::string& text, char character);
// Shorter first, then bytewise: numbered names come out in numeric order.
bool compareStringsNumeric(const std::string& a, const std::string& b);
void numericSort(std::vector<std::string>& list);
// Bits, highest first, in groups of eight separated by a blank: 8 digits below 256, else 32.
std::string toBits(unsigned int value);

// Both bring an input of up to one turn below zero to a non-negative result.
float radianToDegree(float radian);
float degreeToRadian(float degree);

}  // namespace LQ
