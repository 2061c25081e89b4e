#include "NitfTestFile.h"

#include <stdexcept>

nitfsample::File fileOf(const nitfsample::Image& image) {
    nitfsample::File file;
    file.images = {image};
    return file;
}

std::string fieldText(PropertyMap& fields, const char* name) {
    CNitfProperty* value = FindProperty(fields, name);
    return value ? value->toText() : "<absent>";
}

std::string trimmed(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

OpenedSample::OpenedSample(const nitfsample::File& file, const std::string& name)
    : m_file(new TempFile(nitfsample::build(file), "-" + name)) {
    if (!m_reader.open(m_file->path().c_str()))
        throw std::runtime_error("cannot open " + m_file->path());
}

OpenedSample::OpenedSample(const std::string& bytes) : m_file(new TempFile(bytes)) {
    if (!m_reader.open(m_file->path().c_str()))
        throw std::runtime_error("cannot open " + m_file->path());
}

CNitfImageSource& OpenedSample::source(int index) {
    std::unique_ptr<CNitfImageSource>& source = m_sources[index];
    if (!source)
        source.reset(m_reader.getNewImageSource(index));
    return *source;
}
