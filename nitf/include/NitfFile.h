// The open file that every segment reader and image source is handed.
#pragma once

#include <cstdio>

class CNitfFileHeader;

class CNitfFile {
public:
    virtual ~CNitfFile() {}
    virtual FILE* getInputStream() = 0;
    virtual FILE* getOutputStream() = 0;
    virtual void close() = 0;
    virtual CNitfFileHeader* getFileHeader() = 0;

    CNitfFile& operator=(const CNitfFile&) { return *this; }
};
