// Off-device replacement of Android's log: same signature, messages go to stderr
// unless a test has installed its own sink.
#include "LQ_AndroidLog.h"

#include <cstdarg>
#include <cstdio>
#include <string>
#include <utility>

namespace LQ {
namespace {
LogSink& currentSink() {
    static LogSink sink;
    return sink;
}
}  // namespace

LogSink setLogSink(LogSink sink) {
    LogSink previous = std::move(currentSink());
    currentSink() = std::move(sink);
    return previous;
}
}  // namespace LQ

extern "C" int __android_log_print(int priority, const char* tag, const char* format, ...) {
    va_list args;
    va_start(args, format);
    va_list copy;
    va_copy(copy, args);
    const int length = std::vsnprintf(nullptr, 0, format, copy);
    va_end(copy);
    std::string text(length > 0 ? static_cast<size_t>(length) : 0u, '\0');
    if (length > 0) std::vsnprintf(&text[0], text.size() + 1, format, args);
    va_end(args);

    const LQ::LogSink& sink = LQ::currentSink();
    if (sink) {
        sink(priority, tag, text.c_str());
    } else {
        const char letter = priority >= ANDROID_LOG_ERROR ? 'E' : 'I';
        const bool newline = !text.empty() && text.back() == '\n';
        std::fprintf(stderr, "%c/%s: %s%s", letter, tag, text.c_str(), newline ? "" : "\n");
    }
    return length;
}
