// The entry point for reading: opens a file, detects its version, reads its file header, and hands out new
// objects for the segments asked for by index. Every object a getNew... call returns belongs to the caller.
//
// Threads: a reader, and every object it hands out, is used by one thread at a time. Several readers of the
// same file, each with its own stream, may be used on several threads at once; that is how to decode one
// image on several threads (each thread its own reader and image source).
#pragma once

#include <cstdio>

#include "HostFile.h"
#include "NitfFile.h"
#include "NitfFileHeader.h"

class CNitfImageSource;
class CNitfSymbolSource;
class CNitfLabelSource;
class CNitfTextSource;
class CNitfDataExtensionSource;
class CNitfExtension;
class CRpfSource;

class CNitfFileReader : public CNitfFile {
public:
    CNitfFileReader();
    ~CNitfFileReader() override;
    CNitfFileReader(const CNitfFileReader&) = delete;
    CNitfFileReader& operator=(const CNitfFileReader&) = delete;

    // Opens the file read-only (binary) and, the first time, reads its header. Returns null, changing
    // nothing, when the file cannot be opened; raises vexo::Exception for a file of unknown version. A reader
    // keeps the header of the first file it opened.
    FILE* open(const char* fileName, const char* access = "rb");
    // The same over `size` bytes of memory, which must outlive the reader's use of them.
    FILE* openMemory(const void* data, size_t size);
    // The same over a stream the caller supplies (see DKStreamCallbacks in HostFile.h), for instance a
    // language binding's file object.
    FILE* openStream(const DKStreamCallbacks& callbacks);
    void close() override;
    bool isOpen() const { return m_open; }

    FILE* getInputStream() override { return m_fp; }
    FILE* getOutputStream() override { return m_fp; }
    CNitfFileHeader* getFileHeader() override { return m_header; }

    int getImageCount() const;
    int getSymbolCount() const;
    int getLabelCount() const;
    int getTextCount() const;
    int getDataExtensionCount() const;

    CNitfImageSource* getNewImageSource(int index);
    CNitfSymbolSource* getNewSymbolSource(int index);
    CNitfLabelSource* getNewLabelSource(int index);
    CNitfTextSource* getNewTextSource(int index);
    CNitfDataExtensionSource* getNewDataExtensionSource(int index);

    // Whether the file header holds an RPFHDR TRE (a frame file or a NITF-wrapped A.TOC).
    bool hasExtensionRpf();
    // A new RPF table of contents read from the RPFHDR TRE's header section, or null when there is none.
    // Raises vexo::Exception for a damaged table.
    CRpfSource* getNewExtensionRpfSource();
    CNitfExtension* getNewExtensionPIAPRD();

    // "<width>x<height> Pixels, <bits> Bits per Pixel" of image `index` into `text`.
    void describeImageSource(int index, char* text);

protected:
    // The first file-level TRE named exactly `name`, or null; it stays owned by the header.
    CNitfTag* getExtensionTag(const char* name);

private:
    CNitfFileHeader* getNewFileHeader();
    // Makes `fp` the reader's stream (null: nothing changes) and reads the header the first time.
    FILE* adopt(FILE* fp);

    bool m_open;
    FILE* m_fp;
    CNitfFileHeader* m_header;
};
