#include "LogCapture.h"

#include <cstring>
#include <sstream>

LogCapture::LogCapture() {
    previous_ = LQ::setLogSink(
        [this](int priority, const char* tag, const char* text) { entries_.push_back({priority, tag, text}); });
}

LogCapture::~LogCapture() { LQ::setLogSink(previous_); }

std::string LogCapture::text() const {
    std::string all;
    for (const auto& entry : entries_) all += entry.text + "\n";
    return all;
}

FailedCheck catchCheck(const std::function<void()>& body) {
    FailedCheck check;
    LogCapture capture;
    try {
        body();
    } catch (const char* what) {
        check.thrown = std::strcmp(what, "assertion") == 0;
    }
    for (const auto& entry : capture.entries()) {
        if (entry.priority != ANDROID_LOG_ERROR) continue;
        const std::string& text = entry.text;
        check.fullText = text;
        const std::string head = "Assertion `";
        const std::string failedIn = "` failed in ";
        if (text.compare(0, head.size(), head) != 0) break;
        const size_t expressionEnd = text.find(failedIn);
        const size_t lineAt = text.find(" line ", expressionEnd);
        const size_t functionAt = text.find(", function ", lineAt);
        const size_t colon = text.find(":    \n", functionAt);
        if (expressionEnd == std::string::npos || lineAt == std::string::npos || functionAt == std::string::npos ||
            colon == std::string::npos)
            break;
        check.expression = text.substr(head.size(), expressionEnd - head.size());
        check.file = text.substr(expressionEnd + failedIn.size(), lineAt - expressionEnd - failedIn.size());
        check.line = std::stoi(text.substr(lineAt + 6, functionAt - lineAt - 6));
        check.function = text.substr(functionAt + 11, colon - functionAt - 11);
        check.tail = text.substr(colon + 6);
        if (!check.tail.empty() && check.tail.back() == '\n') check.tail.pop_back();
        break;
    }
    return check;
}
