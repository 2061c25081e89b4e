#include "Canonical.h"

#include <memory>
#include <stdexcept>

#include <fcntl.h>
#include <unistd.h>

#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfRegionReader.h"
#include "RawExtract.h"
#include "TestFiles.h"

CanonicalImage canonicalImage(const std::string& path, int image, int threads) {
    TempFile output("", ".raw");
    const int fd = ::open(output.path().c_str(), O_WRONLY | O_TRUNC);
    if (fd < 0)
        throw std::runtime_error("cannot write " + output.path());
    nitfextract::Request request;
    request.path = path;
    request.image = image;
    request.threads = threads;
    nitfextract::Outcome outcome;
    try {
        outcome = nitfextract::writeRaw(request, fd);
    } catch (...) {
        ::close(fd);
        throw;
    }
    ::close(fd);

    CNitfFileReader reader;
    reader.open(path.c_str());
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(image));
    const int bands = source->getImageProperties().getBandCount();
    const std::string bytes = output.read();
    CanonicalImage result;
    const size_t band = bytes.size() / bands;
    for (int b = 0; b < bands; ++b)
        result.bands.push_back(bytes.substr(b * band, band));
    result.absentBlocks = outcome.absentBlocks;
    result.failedBlocks = outcome.failedBlocks;
    result.firstError = outcome.firstError;
    return result;
}

std::string canonicalBand(CNitfFile& file, CNitfImageSource& source, int band) {
    CNitfRegionReader region(&file, &source);
    region.setBigEndian(true);
    std::string samples(region.getBufferSize(region.getWidth(), region.getHeight(), 1), '\0');
    region.read(0, 0, region.getWidth(), region.getHeight(), {band}, &samples[0]);
    return samples;
}
