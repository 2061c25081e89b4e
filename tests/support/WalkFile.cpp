#include "WalkFile.h"

#include <memory>

#include "HostError.h"
#include "NitfDataExtensionSource.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfLabelSource.h"
#include "NitfSymbolSource.h"
#include "NitfTextSource.h"

namespace {

void touchTags(std::list<CNitfTag*>& tags) {
    for (CNitfTag* tag : tags)
        (void)tag->isKnownExtension();
}

template <typename Source> void walkSegment(Source* source, CNitfFileReader& reader) {
    std::unique_ptr<Source> owned(source);
    touchTags(owned->getTaggedRecords());
    try {
        free(owned->getNewData(&reader));
    } catch (const vexo::Exception&) {
        // Data that runs past the end of the file is refused; the sub-header stays usable.
    }
}

void walk(CNitfFileReader& reader) {
    CNitfFileHeader* header = reader.getFileHeader();
    char title[128];
    header->getTitle(title);
    for (int i = 0; i < reader.getDataExtensionCount(); ++i)
        walkSegment(reader.getNewDataExtensionSource(i), reader);
    touchTags(header->getTaggedRecords());
    for (int i = 0; i < reader.getImageCount(); ++i) {
        std::unique_ptr<CNitfImageSubheader> image(header->getNewImageSubheader(reader.getInputStream(), i));
        if (!image)
            continue;
        image->getTitle(title);
        char comment[82];
        for (int c = 0; c < image->getCommentCount(); ++c)
            image->readComment(reader.getInputStream(), c, comment);
        touchTags(image->getTaggedRecords());
    }
    for (int i = 0; i < reader.getSymbolCount(); ++i)
        walkSegment(reader.getNewSymbolSource(i), reader);
    for (int i = 0; i < reader.getLabelCount(); ++i)
        walkSegment(reader.getNewLabelSource(i), reader);
    for (int i = 0; i < reader.getTextCount(); ++i)
        walkSegment(reader.getNewTextSource(i), reader);
}

} // namespace

void walkFile(const std::string& path, std::string* refusal) {
    try {
        CNitfFileReader reader;
        if (!reader.open(path.c_str()))
            return;
        walk(reader);
    } catch (const vexo::Exception& e) {
        if (refusal)
            *refusal = e.what();
    }
}
