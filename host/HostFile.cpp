// Default host file layer over C stdio. Positions go through fseeko/ftello with a 64-bit off_t so that files
// beyond 4 GB work on every target, 32-bit ones included.
#ifndef _FILE_OFFSET_BITS
#define _FILE_OFFSET_BITS 64
#endif

#include "HostFile.h"

#include <cstring>
#include <mutex>
#include <string>
#include <unordered_map>

#include <stdio_ext.h>
#include <sys/stat.h>
#include <sys/types.h>

static_assert(sizeof(off_t) == 8, "the host file layer needs a 64-bit off_t");

namespace {

// Names of the streams DKOpen opened, for fp2filename. Nodes of an unordered_map never move, so the text
// handed out stays valid until its own stream is closed, whatever other threads open or close meanwhile.
class StreamNames {
public:
    void add(FILE* fp, const char* name) {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_names[fp] = name;
    }
    void remove(FILE* fp) {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_names.erase(fp);
    }
    const char* find(FILE* fp) {
        std::lock_guard<std::mutex> lock(m_mutex);
        auto it = m_names.find(fp);
        return it == m_names.end() ? "" : it->second.c_str();
    }

private:
    std::mutex m_mutex;
    std::unordered_map<FILE*, std::string> m_names;
};

StreamNames& streamNames() {
    static StreamNames names;
    return names;
}

// Streams made over callbacks: their size comes from the callbacks, not from a file descriptor.
class CallbackSizes {
public:
    void add(FILE* fp, const DKStreamCallbacks* callbacks) {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_streams[fp] = callbacks;
    }
    void remove(FILE* fp) {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_streams.erase(fp);
    }
    bool find(FILE* fp, __int64& size) {
        std::lock_guard<std::mutex> lock(m_mutex);
        auto it = m_streams.find(fp);
        if (it == m_streams.end())
            return false;
        size = it->second->size ? it->second->size(it->second->user) : -1;
        return true;
    }

private:
    std::mutex m_mutex;
    std::unordered_map<FILE*, const DKStreamCallbacks*> m_streams;
};

CallbackSizes& callbackSizes() {
    static CallbackSizes sizes;
    return sizes;
}

// The cookie of a callback stream: the callbacks (owned copy) and the position, which the C library's seeks
// relative to the current position or the end need.
struct CallbackStream {
    DKStreamCallbacks callbacks;
    long long position = 0;
};

ssize_t callbackRead(void* cookie, char* buffer, size_t size) {
    CallbackStream& stream = *static_cast<CallbackStream*>(cookie);
    const long long got = stream.callbacks.read(stream.callbacks.user, buffer, size);
    if (got > 0)
        stream.position += got;
    return got < 0 ? -1 : static_cast<ssize_t>(got);
}

int callbackSeek(void* cookie, off64_t* offset, int whence) {
    CallbackStream& stream = *static_cast<CallbackStream*>(cookie);
    long long base = 0;
    if (whence == SEEK_CUR) {
        base = stream.position;
    } else if (whence == SEEK_END) {
        base = stream.callbacks.size ? stream.callbacks.size(stream.callbacks.user) : -1;
        if (base < 0)
            return -1;
    }
    const long long target = base + *offset;
    if (target < 0 || stream.callbacks.seek(stream.callbacks.user, target) != 0)
        return -1;
    stream.position = target;
    *offset = target;
    return 0;
}

int callbackClose(void* cookie) {
    CallbackStream* stream = static_cast<CallbackStream*>(cookie);
    if (stream->callbacks.close)
        stream->callbacks.close(stream->callbacks.user);
    delete stream;
    return 0;
}

// Memory streams are callback streams over a view of the bytes.
struct MemoryView {
    const unsigned char* data;
    size_t size;
    size_t position;
};

long long memoryRead(void* user, void* buffer, size_t size) {
    MemoryView& view = *static_cast<MemoryView*>(user);
    const size_t left = view.position < view.size ? view.size - view.position : 0;
    const size_t count = size < left ? size : left;
    std::memcpy(buffer, view.data + view.position, count);
    view.position += count;
    return static_cast<long long>(count);
}

int memorySeek(void* user, long long offset) {
    static_cast<MemoryView*>(user)->position = static_cast<size_t>(offset);
    return 0;
}

long long memorySize(void* user) {
    return static_cast<long long>(static_cast<MemoryView*>(user)->size);
}

void memoryClose(void* user) {
    delete static_cast<MemoryView*>(user);
}

// The fopen mode for `flags`, as described at DKOpen; empty when the flags cannot be honoured.
std::string modeFromFlags(const char* name, int flags) {
    const bool exists = DKCheck(name);
    if ((flags & DK_EXISTING) && !exists)
        return "";
    std::string mode;
    if ((flags & DK_CREATE) || ((flags & DK_WRITE) && !exists))
        mode = (flags & DK_READ) ? "w+" : "w";
    else if (flags & DK_WRITE)
        mode = "r+";
    else if (flags & DK_READ)
        mode = "r";
    else
        return "";
    if (flags & DK_BINARY)
        mode += 'b';
    return mode;
}

} // namespace

FILE* DKOpen(const char* name, int flags, const char* access) {
    if (!name || !*name)
        return nullptr;
    std::string mode = (access && *access) ? std::string(access) : modeFromFlags(name, flags);
    if (mode.empty())
        return nullptr;
    FILE* fp = std::fopen(name, mode.c_str());
    if (fp)
        streamNames().add(fp, name);
    return fp;
}

FILE* DKOpenCallbacks(const DKStreamCallbacks* callbacks, const char* name) {
    if (!callbacks || !callbacks->read || !callbacks->seek)
        return nullptr;
    CallbackStream* stream = new CallbackStream{*callbacks, 0};
    cookie_io_functions_t io = {callbackRead, nullptr, callbackSeek, callbackClose};
    FILE* fp = fopencookie(stream, "rb", io);
    if (!fp) {
        delete stream;
        return nullptr;
    }
    streamNames().add(fp, name ? name : "");
    callbackSizes().add(fp, &stream->callbacks);
    return fp;
}

FILE* DKOpenMemory(const void* data, size_t size, const char* name) {
    if (!data && size != 0)
        return nullptr;
    MemoryView* view = new MemoryView{static_cast<const unsigned char*>(data), size, 0};
    const DKStreamCallbacks callbacks = {view, memoryRead, memorySeek, memorySize, memoryClose};
    FILE* fp = DKOpenCallbacks(&callbacks, name);
    if (!fp)
        delete view;
    return fp;
}

int DKClose(FILE* fp) {
    if (!fp)
        return EOF;
    streamNames().remove(fp);
    callbackSizes().remove(fp);
    return std::fclose(fp);
}

size_t DKFRead(void* buffer, size_t size, size_t count, FILE* fp) {
    // Headers are read a few bytes at a time; a stream is only ever used by the thread reading it, so the
    // per-call stream lock is pure cost here.
#ifdef __GLIBC__
    return (fp && buffer) ? fread_unlocked(buffer, size, count, fp) : 0;
#else
    return (fp && buffer) ? std::fread(buffer, size, count, fp) : 0;
#endif
}

size_t DKFWrite(const void* buffer, size_t size, size_t count, FILE* fp) {
    return (fp && buffer) ? std::fwrite(buffer, size, count, fp) : 0;
}

int DKFSeek(FILE* fp, long offset, int whence) {
    return DKFSeek64(fp, offset, whence);
}

int DKFSeek64(FILE* fp, __int64 offset, int whence) {
    return fp ? fseeko(fp, static_cast<off_t>(offset), whence) : -1;
}

__int64 DKFTell(FILE* fp) {
    return fp ? static_cast<__int64>(ftello(fp)) : -1;
}

__int64 DKSize(FILE* fp) {
    if (!fp)
        return -1;
    __int64 supplied = -1;
    if (callbackSizes().find(fp, supplied))
        return supplied;
    struct stat info;
    if (fstat(fileno(fp), &info) != 0)
        return -1;
    // A stream being read has the size the file has: a seek past the end must not make it larger. A stream
    // being written may hold bytes not yet flushed (no flush here: on a stream also being read it would throw
    // the read-ahead away); they end at or before its position.
    if (!__fwritable(fp))
        return static_cast<__int64>(info.st_size);
    const __int64 position = ftello(fp);
    return position > info.st_size ? position : static_cast<__int64>(info.st_size);
}

bool DKCheck(const char* name) {
    struct stat info;
    return name && *name && stat(name, &info) == 0 && !S_ISDIR(info.st_mode);
}

const char* fp2filename(FILE* fp) {
    return fp ? streamNames().find(fp) : "";
}
