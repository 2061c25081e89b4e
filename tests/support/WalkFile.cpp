#include "WalkFile.h"

#include <algorithm>
#include <memory>
#include <vector>

#include "HostError.h"
#include "NitfDataExtensionSource.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfImageSource.h"
#include "NitfLabelSource.h"
#include "NitfLutSource.h"
#include "NitfRegionReader.h"
#include "NitfSampleWriter.h"
#include "NitfSymbolSource.h"
#include "NitfTextSource.h"

namespace {

// Buffers beyond this are skipped: a caller would not allocate them for a file this small.
const long long kLargestBuffer = 64LL << 20;
// Enough block reads to reach every code path without making a single input slow.
const int kBlockReads = 4096;

void readImageOf(CNitfFileReader& reader, int index) {
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(index));
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    const long long height = std::max(p.getTileHeight(), 0);
    const long long bandSize =
        std::max<long long>(p.getTileBandBufferSize(), height * std::max(p.getTileBandWidthBufferSize(), 0));
    const long long blockSize =
        std::max<long long>(p.getTileBufferSize(), height * std::max(p.getTileWidthBufferSize(), 0));
    if (bandSize <= 0 || blockSize <= 0 || blockSize > kLargestBuffer)
        return;
    std::vector<char> buffer(static_cast<size_t>(blockSize));
    int reads = 0;
    for (int band = 0; band < p.getBandCount() && reads < kBlockReads; ++band)
        for (int y = 0; y < p.getTileCountY() && reads < kBlockReads; ++y)
            for (int x = 0; x < p.getTileCountX() && reads < kBlockReads; ++x, ++reads)
                source->readTileNonInterleaved(&reader, buffer.data(), band, x, y);
    source->readTileInterleaved(&reader, buffer.data(), 0, 0);
    source->readTileInterleaved(&reader, buffer.data(), p.getTileCountX() - 1, p.getTileCountY() - 1);

    // A bi-level image's first rows, sampled down by two.
    if (p.getBpp() == 1) {
        const int width = std::min(p.getImageActualWidth(), 4096);
        const int rows = std::min(p.getImageActualHeight(), 64);
        std::vector<char> bits(static_cast<size_t>(std::max(rows, 1)) * ((std::max(width, 0) + 7) / 8) + 1);
        source->readBitmap(bits.data(), 0, 0, width, rows, (width + 7) / 8 * 8, rows / 2);
    }
    // The region reader over a window of every band, both layouts.
    CNitfRegionReader region(&reader, source.get());
    const int width = std::min(region.getWidth(), 512), rows = std::min(region.getHeight(), 64);
    if (region.getBufferSize(width, rows, region.getBandCount()) <= static_cast<size_t>(kLargestBuffer)) {
        std::vector<unsigned char> samples(region.getBufferSize(width, rows, region.getBandCount()));
        region.read(region.getWidth() - width, 0, width, rows, {}, samples.data());
        region.setBigEndian(true);
        region.read(0, region.getHeight() - rows, width, rows, {}, samples.data(),
                    CNitfRegionReader::ePixelInterleaved);
    }
    if (region.getResolutionLevels() > 1) {
        region.setLevel(std::min(2, region.getResolutionLevels() - 1));
        const int w = std::min(region.getWidth(), 64), h = std::min(region.getHeight(), 64);
        if (w > 0 && h > 0 &&
            region.getBufferSize(w, h, region.getBandCount()) <= static_cast<size_t>(kLargestBuffer)) {
            std::vector<unsigned char> samples(region.getBufferSize(w, h, region.getBandCount()));
            region.read(0, 0, w, h, {}, samples.data(), CNitfRegionReader::ePixelInterleaved);
        }
    }
    for (int i = 0; i < source->getLutCount(); ++i) {
        CNitfLutSource* lut = source->getLutSource(i);
        std::vector<char> entries(static_cast<size_t>(std::max(lut->getSize(), 0)) + 1);
        lut->readInterleaved(&reader, entries.data(), lut->getSize());
    }
}

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

template <typename Open> void walkOpened(Open open, std::string* refusal) {
    try {
        CNitfFileReader reader;
        if (!open(reader))
            return;
        walk(reader);
    } catch (const vexo::Exception& e) {
        if (refusal)
            *refusal = e.what();
    }
}

} // namespace

void walkFile(const std::string& path, std::string* refusal) {
    walkOpened([&](CNitfFileReader& reader) { return reader.open(path.c_str()) != nullptr; }, refusal);
}

void walkBytes(const void* data, size_t size, std::string* refusal) {
    walkOpened([&](CNitfFileReader& reader) { return reader.openMemory(data, size) != nullptr; }, refusal);
}

std::string readImage(CNitfFileReader& reader, int index) {
    try {
        readImageOf(reader, index);
    } catch (const vexo::Exception& e) {
        return e.what();
    }
    return "";
}

void readEveryImage(CNitfFileReader& reader) {
    for (int index = 0; index < std::min(reader.getImageCount(), 32); ++index)
        readImage(reader, index);
}

void readSample(const nitfsample::Image& image) {
    nitfsample::File file;
    file.images = {image};
    std::string bytes;
    try {
        bytes = nitfsample::build(file);
    } catch (const std::exception&) {
        return; // a shape the writer cannot lay out
    }
    CNitfFileReader reader;
    try {
        if (!reader.openMemory(bytes.data(), bytes.size()))
            return;
    } catch (const vexo::Exception&) {
        return;
    }
    readEveryImage(reader);
}
