// A NITF file built by the independent sample writer, on disk and open in a reader.
#pragma once

#include <memory>
#include <string>

#include "NitfFileReader.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

class OpenedSample {
public:
    explicit OpenedSample(const nitfsample::File& file, const std::string& name = "sample.ntf");
    explicit OpenedSample(const std::string& bytes);

    CNitfFileReader& reader() { return m_reader; }
    CNitfFileHeader* header() { return m_reader.getFileHeader(); }
    const std::string& path() const { return m_file->path(); }

private:
    std::unique_ptr<TempFile> m_file;
    CNitfFileReader m_reader;
};
