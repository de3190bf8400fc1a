#pragma once
// Captures what the library writes to its log, and the parts of a failed check.

#include <functional>
#include <string>
#include <vector>

#include "LQ_AndroidLog.h"

struct LogEntry {
    int priority;
    std::string tag;
    std::string text;
};

// Swaps the log sink for the lifetime of the object.
class LogCapture {
public:
    LogCapture();
    ~LogCapture();
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    const std::vector<LogEntry>& entries() const { return entries_; }
    // all texts, each followed by a newline
    std::string text() const;
    void clear() { entries_.clear(); }

private:
    std::vector<LogEntry> entries_;
    LQ::LogSink previous_;
};

// A failed check as the log shows it.
struct FailedCheck {
    bool thrown = false;         // a const char* "assertion" was thrown
    std::string expression;      // between the backticks
    std::string file;            // after "failed in "
    int line = 0;
    std::string function;
    std::string tail;            // after ":    \n", without the last newline
    std::string fullText;
};

// Runs body, expecting it to throw the check's const char*, and parses the first
// error-priority log message.
FailedCheck catchCheck(const std::function<void()>& body);
