#include "LQ_Utils.h"

#include <cstring>

#include "LQ_AndroidLog.h"

namespace LQ_LOGGER_FORMAT {

std::string alignString(const std::string& text, int width) {
    if (width <= 0) return std::string();
    std::string result = text.substr(0, static_cast<size_t>(width));
    result.resize(static_cast<size_t>(width), ' ');
    return result;
}

std::string toStr(int value, int width, char fill) {
    std::string number = std::to_string(value);
    if (width < 1 || static_cast<int>(number.size()) >= width) return number;
    return std::string(static_cast<size_t>(width) - number.size(), fill) + number;
}

}  // namespace LQ_LOGGER_FORMAT

namespace LQ {

namespace {
const char* levelTag(int level) {
    switch (level) {
        case LOG_LEVEL_DEBUG: return "DEBUG   ";
        case LOG_LEVEL_INFO: return "INFO    ";
        case LOG_LEVEL_WARNING: return "WARNING ";
        default: return "FATAL   ";
    }
}

int levelPriority(int level) { return level >= LOG_LEVEL_FATAL ? ANDROID_LOG_ERROR : ANDROID_LOG_INFO; }

const char* baseName(const char* path) {
    const char* slash = std::strrchr(path, '/');
    return slash ? slash + 1 : path;
}

constexpr size_t LOG_PIECE = 1023;
}  // namespace

int& getLogLevel() {
    static int logLevel = LOG_LEVEL_WARNING;
    return logLevel;
}

std::string alignString(const std::string& text, int width) { return LQ_LOGGER_FORMAT::alignString(text, width); }

void writeLog(int priority, const std::string& text) {
    size_t start = 0;
    while (start < text.size()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos) end = text.size();
        for (size_t piece = start; piece < end; piece += LOG_PIECE) {
            const std::string part = text.substr(piece, std::min(LOG_PIECE, end - piece));
            __android_log_print(priority, LOG_TAG, "%s", part.c_str());
        }
        start = end + 1;
    }
}

std::string formatLogLine(int level, const char* file, int line, const char* function, const std::string& message) {
    std::string text = levelTag(level);
    text += LQ_LOGGER_FORMAT::alignString(baseName(file), 30);
    text += LQ_LOGGER_FORMAT::toStr(line, 4, ' ');
    text += ' ';
    text += LQ_LOGGER_FORMAT::alignString(function, 15);
    text += ' ';
    text += message;
    text += '\n';
    return text;
}

void logMessage(int level, const char* file, int line, const char* function, const std::string& message, bool force) {
    if (!force && !logLevelPasses(level)) return;
    writeLog(levelPriority(level), formatLogLine(level, file, line, function, message));
}

std::string assertionText(const char* expression, const char* file, int line, const char* function,
                          const std::string& tail) {
    std::ostringstream text;
    text << "Assertion `" << expression << "` failed in " << file << " line " << line << ", function " << function
         << ":    \n"
         << tail << "\n";
    return text.str();
}

void failAssertion(const char* expression, const char* file, int line, const char* function, const std::string& tail) {
    const std::string text = assertionText(expression, file, line, function, tail);
    __android_log_print(ANDROID_LOG_ERROR, LOG_TAG, "%s", text.c_str());
    __android_log_print(ANDROID_LOG_ERROR, LOG_TAG, "%s", "*** BACKTRACE: ***\nBacktrace is implemented only for linux");
    throw "assertion";
}

std::string toStr(unsigned long value, int width) {
    std::string number = std::to_string(value);
    if (static_cast<int>(number.size()) >= width) return number;
    return std::string(static_cast<size_t>(width) - number.size(), '0') + number;
}

}  // namespace LQ
