#pragma once
// The one log sink of the library. On the device it is Android's log; elsewhere
// LQ_AndroidLog.cpp stands in with the same signature.
#ifdef __ANDROID__
#include <android/log.h>
#else
enum { ANDROID_LOG_INFO = 4, ANDROID_LOG_ERROR = 6 };
extern "C" int __android_log_print(int priority, const char* tag, const char* format, ...)
    __attribute__((format(printf, 3, 4)));

#include <functional>

namespace LQ {
// Receives each formatted message; tests swap it in to compare log text.
using LogSink = std::function<void(int priority, const char* tag, const char* text)>;
// Installs a sink (an empty one restores stderr) and returns the previous one.
LogSink setLogSink(LogSink sink);
}  // namespace LQ
#endif
