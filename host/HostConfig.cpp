// Default host configuration service: locating configuration files and the "KEY=VALUE" metadata lists.
#include "HostConfig.h"

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <memory>
#include <string>

#include "HostCompat.h"
#include "HostFile.h"
#include "HostMemory.h"

#ifndef NITF_INSTALL_PREFIX
#define NITF_INSTALL_PREFIX "/usr/local"
#endif

namespace {

std::string joinPath(const std::string& base, const char* dir, const char* name) {
    std::string path = base;
    if (dir && *dir)
        path += "/" + std::string(dir);
    return path + "/" + name;
}

std::string trimmed(const std::string& text) {
    size_t first = 0, last = text.size();
    while (first < last && std::isspace(static_cast<unsigned char>(text[first])))
        ++first;
    while (last > first && std::isspace(static_cast<unsigned char>(text[last - 1])))
        --last;
    return text.substr(first, last - first);
}

// The entry of `key` in `list`, or null.
char** findEntry(char** list, const char* key) {
    size_t keyLength = std::strlen(key);
    for (char** entry = list; entry && *entry; ++entry)
        if (_strnicmp(*entry, key, keyLength) == 0 && (*entry)[keyLength] == '=')
            return entry;
    return nullptr;
}

struct MemoryFree {
    void operator()(void* block) const { std::free(block); }
};

struct FileCloser {
    void operator()(FILE* fp) const { std::fclose(fp); }
};

// Reads one line of any length without its line end; false at the end of the file.
bool readLine(FILE* fp, std::string& line) {
    line.clear();
    int c;
    while ((c = std::fgetc(fp)) != EOF && c != '\n')
        line += static_cast<char>(c);
    return c != EOF || !line.empty();
}

} // namespace

char* IMPFindFile(const char* dir, const char* name) {
    if (!name || !*name)
        return nullptr;
    std::string candidates[3];
    int count = 0;
    const char* home = std::getenv("NITF_HOME");
    if (home && *home)
        candidates[count++] = joinPath(home, dir, name);
    candidates[count++] = joinPath(NITF_INSTALL_PREFIX, dir, name);
    candidates[count++] = joinPath(".", dir, name);
    for (int i = 0; i < count; ++i)
        if (DKCheck(candidates[i].c_str()))
            return HString(candidates[i].c_str());
    return nullptr;
}

char** TextFileToStringList(const char* path) {
    if (!path)
        return nullptr;
    std::unique_ptr<FILE, FileCloser> fp(std::fopen(path, "r"));
    if (!fp)
        return nullptr;
    char** list = static_cast<char**>(HCalloc(1, sizeof(char*)));
    std::string line;
    while (readLine(fp.get(), line)) {
        std::string text = trimmed(line);
        if (text.empty() || text[0] == '#')
            continue;
        // The first separator ends the key, so values may themselves contain '=' or ':' ("TIME=12:00").
        size_t separator = text.find_first_of("=:");
        if (separator == std::string::npos)
            continue;
        std::string key = trimmed(text.substr(0, separator));
        if (!key.empty())
            list = SetAuxEntry(list, key.c_str(), trimmed(text.substr(separator + 1)).c_str());
    }
    return list;
}

const char* FetchAuxEntry(char** list, const char* key) {
    if (!key)
        return nullptr;
    char** entry = findEntry(list, key);
    return entry ? *entry + std::strlen(key) + 1 : nullptr;
}

char** SetAuxEntry(char** list, const char* key, const char* value) {
    if (!key || !*key)
        return list;
    std::unique_ptr<char, MemoryFree> text(MkName("%s=%s", key, value ? value : ""));
    if (char** entry = findEntry(list, key)) {
        std::free(*entry);
        *entry = text.release();
        return list;
    }
    size_t count = static_cast<size_t>(CountStringList(list));
    list = static_cast<char**>(HRealloc(list, (count + 2) * sizeof(char*)));
    list[count] = text.release();
    list[count + 1] = nullptr;
    return list;
}

int CountStringList(char** list) {
    int count = 0;
    while (list && list[count])
        ++count;
    return count;
}

void DestroyStringList(char** list) {
    for (char** entry = list; entry && *entry; ++entry)
        std::free(*entry);
    std::free(list);
}

char* IMPTime(char* out, int format) {
    if (!out)
        return nullptr;
    out[0] = '\0';
    const char* pattern = format == 11 ? "%d/%m/%Y" : format == 12 ? "%H:%M:%S" : nullptr;
    std::time_t now = std::time(nullptr);
    std::tm local;
    if (pattern && localtime_r(&now, &local))
        std::strftime(out, 20, pattern, &local);
    return out;
}
