// A NITF file built by the independent sample writer, on disk and open in a reader.
#pragma once

#include <map>
#include <memory>
#include <string>

#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

// A file of this one image.
nitfsample::File fileOf(const nitfsample::Image& image);

// The text of field `name` ("<absent>" when there is none), and text without its trailing blanks.
std::string fieldText(PropertyMap& fields, const char* name);
std::string trimmed(std::string text);

class OpenedSample {
public:
    explicit OpenedSample(const nitfsample::File& file, const std::string& name = "sample.ntf");
    explicit OpenedSample(const nitfsample::Image& image) : OpenedSample(fileOf(image)) {}
    explicit OpenedSample(const std::string& bytes);

    CNitfFileReader& reader() { return m_reader; }
    CNitfFileHeader* header() { return m_reader.getFileHeader(); }
    const std::string& path() const { return m_file->path(); }

    // Image `index`'s source, made on first use (throwing what the reader throws) and kept with the file.
    CNitfImageSource& source(int index = 0);
    // The same as the kind of source the reader must have made (std::bad_cast otherwise).
    template <typename Source> Source& source(int index = 0) { return dynamic_cast<Source&>(source(index)); }

private:
    std::unique_ptr<TempFile> m_file;
    CNitfFileReader m_reader;
    std::map<int, std::unique_ptr<CNitfImageSource>> m_sources;
};
