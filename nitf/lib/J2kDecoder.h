// Decodes JPEG 2000 image data (a bare codestream or a JP2 file) with OpenJPEG, area by area, straight into a
// caller's buffer. Coordinates are those of the image grid: the sampling grid of the finest component, which
// is the grid NITF describes an image on (NCOLS x NROWS), reduced by 2^level for level > 0. Components on a
// coarser grid (sub-sampled chroma, for example) are replicated onto it. Only the tiles under an area are
// decoded; a single-tile codestream decodes just the area.
//
// Delivered samples: each band in the container of `sampleBytes` bytes (1, 2, 4 or 8) in native byte order,
// sign-extended for signed components and zero-extended otherwise. A band is a codestream component, or a
// palette column of one when the JP2 palette makes the bands.
#pragma once

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "J2kCodestreamHeader.h"
#include "Jp2Boxes.h"

class CJ2kSegmentStream;

class CJ2kDecoder {
public:
    // Where an area's samples go: row r of the area at buffer + r * rowBytes, its pixels pixelBytes apart,
    // band i of a pixel at i * sampleBytes.
    struct Output {
        char* buffer = nullptr;
        long long rowBytes = 0;
        int pixelBytes = 1;
        int sampleBytes = 1;
    };

    CJ2kDecoder();
    ~CJ2kDecoder();
    CJ2kDecoder(const CJ2kDecoder&) = delete;
    CJ2kDecoder& operator=(const CJ2kDecoder&) = delete;

    // Opens the `length` bytes of JPEG 2000 data at `offset` of the file and reads their headers. Raises
    // vexo::Exception for data that is not JPEG 2000, damaged headers, or sizes the data cannot justify.
    void open(FILE* fp, long long offset, long long length);
    bool isOpen() const { return m_range != nullptr; }

    const CJ2kCodestreamHeader& codestream() const { return m_header; }
    bool isJp2() const { return m_isJp2; }
    const jp2::Metadata& jp2Metadata() const { return m_jp2; }
    // Resolution levels every component has: level 0 (full size) to resolutionLevels() - 1.
    int resolutionLevels() const { return m_resolutionLevels; }
    // The image grid's size at `level`.
    int width(int level = 0) const;
    int height(int level = 0) const;
    int componentCount() const { return static_cast<int>(m_header.components.size()); }

    // Chooses what the `bands` delivered bands are: the first `bands` components, or the channels of the JP2
    // component mapping when that is what gives the band count. Raises when the data cannot give them.
    void mapBands(int bands);
    int bandCount() const { return static_cast<int>(m_bands.size()); }
    int bandPrecision(int band) const;
    bool bandIsSigned(int band) const;

    // Decodes bands [firstBand, firstBand + bands) of the area x, y, width, height of the image grid at
    // `level` into `out`. Raises vexo::Exception with OpenJPEG's message for a damaged codestream, and for an
    // area outside the image or a container too small for the samples; the decoder stays usable.
    void decode(int level, int x, int y, int width, int height, int firstBand, int bands, const Output& out);

    // OpenJPEG tile decodes so far, and bytes of the data read so far.
    long long tileDecodes() const { return m_tileDecodes; }
    long long bytesRead() const;

private:
    struct Band {
        int component = 0;
        int paletteColumn = -1; // -1: the component's own values
    };
    struct Area; // an area of the image grid at one level, in absolute coordinates
    class Session;

    void startSession(int level);
    void decodeTiled(const Area& area, int firstBand, int bands, const Output& out);
    void decodeWhole(const Area& area, int firstBand, int bands, const Output& out);
    void decodeUntiled(const Area& area, int firstBand, int bands, const Output& out);
    void checkDecodeSize(long long width, long long height, int level) const;
    void copyBands(const struct opj_image* image, const Area& area, int firstBand, int bands,
                   const Output& out) const;
    bool copyRgb8(const struct opj_image* image, const Area& area, int firstBand, int bands,
                  const Output& out) const;
    template <typename Sample>
    void copyBand(const struct opj_image_comp& comp, const Band& band, const Area& area, char* out,
                  long long rowBytes, int pixelBytes) const;
    [[noreturn]] void raiseCodecError(const char* what);

    std::unique_ptr<CJ2kSegmentStream> m_range;
    std::unique_ptr<Session> m_session;
    CJ2kCodestreamHeader m_header;
    bool m_isJp2 = false;
    jp2::Metadata m_jp2;
    std::vector<Band> m_bands;
    int m_gridDx = 1; // the image grid's spacing on the reference grid
    int m_gridDy = 1;
    int m_resolutionLevels = 1;
    long long m_tileDecodes = 0;
    std::string m_codecError;
};
