// Host error, warning and debug services.
#pragma once

#include <exception>
#include <functional>
#include <string>

namespace vexo {

// The one exception type the library raises: a fixed message, the text of the failing function's signature,
// and the source file (without extension) and line that raised it.
class Exception : public std::exception {
public:
    Exception(const char* message, const char* signature, const char* file, int line);
    Exception(const std::string& message, const char* signature, const char* file, int line);

    const char* what() const noexcept override { return m_message.c_str(); }
    const char* getMessage() const noexcept { return m_message.c_str(); }
    const char* getSignature() const noexcept { return m_signature.c_str(); }
    const char* getFile() const noexcept { return m_file.c_str(); }
    int getLine() const noexcept { return m_line; }

private:
    std::string m_message;
    std::string m_signature;
    std::string m_file;
    int m_line;
};

namespace nspio {

// Warnings go to stderr unless an application (or a test) installs its own handler.
class Warning {
public:
    using Handler = std::function<void(const char* message, const char* file, int line)>;

    static void Warn(const char* message, const char* file, int line);
    // Installs `handler` (an empty one restores stderr) and returns the previous handler.
    static Handler setHandler(Handler handler);
};

// Debug traces, by module tag (the library uses "segrix"), shown when the level is above zero. The level starts
// from the environment variable NITF_DEBUG and can be changed from code.
class Debugger {
public:
    using Handler = std::function<void(const char* module, const char* message, const char* file, int line)>;

    static void Debug(const char* module, const char* message, const char* file, int line);
    static int getLevel();
    static void setLevel(int level);
    static Handler setHandler(Handler handler);
};

} // namespace nspio
} // namespace vexo

// Raises vexo::Exception; for host code that reports errors by call rather than by throw.
[[noreturn]] void IMPError(const char* message, const char* signature, const char* file, int line);

// True when the debug level is above `level` (so that costly trace text is only built when it will be shown).
bool DebugOver(int level);
