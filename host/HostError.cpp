// Default host error, warning and debug services: exceptions carry their origin, warnings and debug traces go
// to stderr unless the application installs handlers.
#include "HostError.h"

#include <algorithm>
#include <atomic>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <utility>

namespace {

const char* orEmpty(const char* text) {
    return text ? text : "";
}

// The handlers are kept behind one mutex: a host application may warn from several threads while another
// thread installs a handler. Handlers are called outside the lock so that they may warn themselves.
std::mutex& handlerMutex() {
    static std::mutex mutex;
    return mutex;
}

vexo::nspio::Warning::Handler& warningHandler() {
    static vexo::nspio::Warning::Handler handler;
    return handler;
}

vexo::nspio::Debugger::Handler& debugHandler() {
    static vexo::nspio::Debugger::Handler handler;
    return handler;
}

// The debug level starts from NITF_DEBUG (a decimal number; anything else counts as 0) the first time it is
// needed, so that an application can set the variable before its first call into the library.
std::atomic<int>& debugLevel() {
    static std::atomic<int> level{[] {
        const char* text = std::getenv("NITF_DEBUG");
        if (!text)
            return 0;
        long value = std::strtol(text, nullptr, 10); // saturates at LONG_MIN/LONG_MAX, unlike atoi
        return static_cast<int>(std::clamp<long>(value, INT_MIN, INT_MAX));
    }()};
    return level;
}

template <typename Handler> Handler exchangeHandler(Handler& slot, Handler handler) {
    std::lock_guard<std::mutex> lock(handlerMutex());
    return std::exchange(slot, std::move(handler));
}

template <typename Handler> Handler currentHandler(const Handler& slot) {
    std::lock_guard<std::mutex> lock(handlerMutex());
    return slot;
}

} // namespace

namespace vexo {

Exception::Exception(const char* message, const char* signature, const char* file, int line)
    : m_message(orEmpty(message)), m_signature(orEmpty(signature)), m_file(orEmpty(file)), m_line(line) {}

Exception::Exception(const std::string& message, const char* signature, const char* file, int line)
    : m_message(message), m_signature(orEmpty(signature)), m_file(orEmpty(file)), m_line(line) {}

namespace nspio {

void Warning::Warn(const char* message, const char* file, int line) {
    Handler handler = currentHandler(warningHandler());
    if (handler)
        handler(orEmpty(message), orEmpty(file), line);
    else
        std::fprintf(stderr, "warning: %s (%s:%d)\n", orEmpty(message), orEmpty(file), line);
}

Warning::Handler Warning::setHandler(Handler handler) {
    return exchangeHandler(warningHandler(), std::move(handler));
}

void Debugger::Debug(const char* module, const char* message, const char* file, int line) {
    if (getLevel() <= 0)
        return;
    Handler handler = currentHandler(debugHandler());
    if (handler)
        handler(orEmpty(module), orEmpty(message), orEmpty(file), line);
    else
        std::fprintf(stderr, "[%s] %s (%s:%d)\n", orEmpty(module), orEmpty(message), orEmpty(file), line);
}

int Debugger::getLevel() {
    return debugLevel().load(std::memory_order_relaxed);
}

void Debugger::setLevel(int level) {
    debugLevel().store(level, std::memory_order_relaxed);
}

Debugger::Handler Debugger::setHandler(Handler handler) {
    return exchangeHandler(debugHandler(), std::move(handler));
}

} // namespace nspio
} // namespace vexo

void IMPError(const char* message, const char* signature, const char* file, int line) {
    throw vexo::Exception(message, signature, file, line);
}

bool DebugOver(int level) {
    return vexo::nspio::Debugger::getLevel() > level;
}
