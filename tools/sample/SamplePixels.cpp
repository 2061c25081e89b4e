// Image data: blocking geometry, sample packing in every IMODE, the block mask record of masked images.
#include "SampleInternal.h"

#include <memory>
#include <stdexcept>

namespace nitfsample {

namespace {

uint64_t sampleMask(int nbpp) {
    return nbpp >= 64 ? ~uint64_t(0) : (uint64_t(1) << nbpp) - 1;
}

bool isMasked(const Image& image) {
    return image.ic == "NM" || (!image.ic.empty() && image.ic[0] == 'M');
}

void appendBigEndian(std::string& out, uint64_t value, int bytes) {
    for (int shift = 8 * (bytes - 1); shift >= 0; shift -= 8)
        out += static_cast<char>((value >> shift) & 0xFF);
}

// The image's samples, masked to NBPP bits, with the pad value outside the image.
class SampleSource {
public:
    explicit SampleSource(const Image& image)
        : pattern_(image.sample ? &image.sample : &defaultFunction()), mask_(sampleMask(image.nbpp)),
          pad_(image.padValue & mask_), rows_(image.rows), cols_(image.cols) {}

    uint64_t operator()(int band, int row, int col) const {
        if (row >= rows_ || col >= cols_)
            return pad_;
        return (*pattern_)(band, row, col) & mask_;
    }

private:
    using Function = std::function<uint64_t(int, int, int)>;
    static const Function& defaultFunction() {
        static const Function function = defaultPattern;
        return function;
    }

    const Function* pattern_;
    uint64_t mask_;
    uint64_t pad_;
    int rows_;
    int cols_;
};

// Packs samples most significant bit first and streams the bytes to a sink in chunks. Each stream (a block,
// or one band of a block) ends on a whole byte and is padded with zero bytes to its expected size.
class BlockPacker {
public:
    BlockPacker(detail::Sink& sink, int bits)
        : sink_(sink), bits_(bits), wholeBytes_(bits % 8 == 0 ? bits / 8 : 0), buffer_(new char[kChunk]) {}
    BlockPacker(const BlockPacker&) = delete;
    BlockPacker& operator=(const BlockPacker&) = delete;

    void put(uint64_t value) {
        if (used_ > kChunk - 8)
            drain();
        if (wholeBytes_ != 0) {
            for (int shift = 8 * (wholeBytes_ - 1); shift >= 0; shift -= 8)
                buffer_[used_++] = static_cast<char>(value >> shift);
            streamBytes_ += wholeBytes_;
            return;
        }
        pending_ = (pending_ << bits_) | value;
        pendingBits_ += bits_;
        while (pendingBits_ >= 8) {
            pendingBits_ -= 8;
            buffer_[used_++] = static_cast<char>(pending_ >> pendingBits_);
            ++streamBytes_;
            if (used_ == kChunk)
                drain();
        }
        pending_ &= (uint64_t(1) << pendingBits_) - 1;
    }

    // Ends the current stream: the last partial byte, then zero bytes up to `size`.
    void finish(uint64_t size) {
        if (pendingBits_ != 0) {
            putByte(static_cast<char>(pending_ << (8 - pendingBits_)));
            pending_ = 0;
            pendingBits_ = 0;
        }
        while (streamBytes_ < size)
            putByte(0);
        streamBytes_ = 0;
    }

    void drain() {
        sink_.put(buffer_.get(), used_);
        used_ = 0;
    }

private:
    static constexpr std::size_t kChunk = 1 << 16;

    void putByte(char byte) {
        if (used_ == kChunk)
            drain();
        buffer_[used_++] = byte;
        ++streamBytes_;
    }

    detail::Sink& sink_;
    int bits_;
    int wholeBytes_;
    std::unique_ptr<char[]> buffer_;
    std::size_t used_ = 0;
    uint64_t streamBytes_ = 0;
    uint64_t pending_ = 0;
    int pendingBits_ = 0;
};

// Writes block entry `entry`: one band of one block for IMODE S, a whole block otherwise.
void packEntry(const Image& image, const Geometry& g, const SampleSource& source, int entry,
               BlockPacker& packer) {
    const int blocks = g.blocksPerRow * g.blocksPerColumn;
    const int block = image.imode == 'S' ? entry % blocks : entry;
    const int x0 = (block % g.blocksPerRow) * g.blockWidth;
    const int y0 = (block / g.blocksPerRow) * g.blockHeight;
    auto packBand = [&](int band) {
        for (int r = 0; r < g.blockHeight; ++r)
            for (int c = 0; c < g.blockWidth; ++c)
                packer.put(source(band, y0 + r, x0 + c));
        packer.finish(g.tileBandBytes);
    };
    switch (image.imode) {
    case 'S':
        packBand(entry / blocks);
        break;
    case 'B':
        for (int band = 0; band < image.bands; ++band)
            packBand(band);
        break;
    case 'P':
        for (int r = 0; r < g.blockHeight; ++r)
            for (int c = 0; c < g.blockWidth; ++c)
                for (int band = 0; band < image.bands; ++band)
                    packer.put(source(band, y0 + r, x0 + c));
        packer.finish(g.tileBytes);
        break;
    default: // 'R'
        for (int r = 0; r < g.blockHeight; ++r)
            for (int band = 0; band < image.bands; ++band)
                for (int c = 0; c < g.blockWidth; ++c)
                    packer.put(source(band, y0 + r, x0 + c));
        packer.finish(g.tileBytes);
        break;
    }
}

// The stored size of each block entry (absent entries included).
std::vector<uint64_t> entrySizes(const Image& image) {
    std::vector<uint64_t> sizes;
    if (!image.blockData.empty()) {
        for (const std::string& block : image.blockData)
            sizes.push_back(block.size());
        return sizes;
    }
    Geometry g = geometry(image);
    sizes.assign(blockEntryCount(image), image.imode == 'S' ? g.tileBandBytes : g.tileBytes);
    return sizes;
}

std::string maskRecord(const Image& image, const std::vector<uint64_t>& sizes) {
    const int count = static_cast<int>(sizes.size());
    const int codeBytes = (image.padCodeBits + 7) / 8;
    const uint64_t length =
        10 + codeBytes + (image.blockMaskRecords ? 4 * count : 0) + (image.padMaskRecords ? 4 * count : 0);
    std::string record;
    appendBigEndian(record, length, 4); // IMDATOFF: the blocks follow the record directly
    appendBigEndian(record, image.blockMaskRecords ? 4 : 0, 2);
    appendBigEndian(record, image.padMaskRecords ? 4 : 0, 2);
    appendBigEndian(record, image.padCodeBits, 2);
    appendBigEndian(record, image.padValue, codeBytes);
    std::vector<uint64_t> offsets(count, 0xFFFFFFFF);
    uint64_t offset = 0;
    for (int e = 0; e < count; ++e) {
        if (image.absentBlocks.count(e) != 0)
            continue;
        if (offset >= 0xFFFFFFFF)
            throw std::invalid_argument("nitfsample: a block offset does not fit in the block mask");
        offsets[e] = offset;
        offset += sizes[e];
    }
    if (image.blockMaskRecords)
        for (uint64_t o : offsets)
            appendBigEndian(record, o, 4);
    if (image.padMaskRecords)
        for (int e = 0; e < count; ++e)
            appendBigEndian(record, image.padBlocks.count(e) != 0 ? offsets[e] : 0xFFFFFFFF, 4);
    return record;
}

} // namespace

uint64_t defaultPattern(int band, int row, int col) {
    uint64_t r = static_cast<uint64_t>(row), c = static_cast<uint64_t>(col), b = static_cast<uint64_t>(band);
    return (r * 7 + c * 13 + b * 101) ^ ((r * c) >> 5);
}

Geometry geometry(const Image& image) {
    Geometry g;
    g.blockWidth = image.nppbh > 0 ? image.nppbh : image.cols;
    g.blockHeight = image.nppbv > 0 ? image.nppbv : image.rows;
    if (g.blockWidth > 0)
        g.blocksPerRow = (image.cols + g.blockWidth - 1) / g.blockWidth;
    if (g.blockHeight > 0)
        g.blocksPerColumn = (image.rows + g.blockHeight - 1) / g.blockHeight;
    uint64_t bits = uint64_t(g.blockWidth) * uint64_t(g.blockHeight) * uint64_t(image.nbpp);
    g.tileBandBytes = (bits + 7) / 8;
    g.tileBytes = uint64_t(image.bands) * g.tileBandBytes;
    return g;
}

int blockEntryCount(const Image& image) {
    Geometry g = geometry(image);
    int blocks = g.blocksPerRow * g.blocksPerColumn;
    return image.imode == 'S' ? blocks * image.bands : blocks;
}

uint64_t sampleAt(const Image& image, int band, int row, int col) {
    return SampleSource(image)(band, row, col);
}

std::string canonicalBand(const Image& image, int band) {
    if (!image.blockData.empty())
        throw std::logic_error("nitfsample: canonicalBand needs samples; this image is given as block data");
    if (band < 0 || band >= image.bands)
        throw std::invalid_argument("nitfsample: no band " + std::to_string(band));
    const Geometry g = geometry(image);
    const SampleSource source(image);
    const int bytes = (image.nbpp + 7) / 8;
    const bool holes = isMasked(image) && !image.absentBlocks.empty();
    const int firstEntry = image.imode == 'S' ? band * g.blocksPerRow * g.blocksPerColumn : 0;
    std::string out;
    out.reserve(std::size_t(image.rows) * std::size_t(image.cols) * std::size_t(bytes));
    for (int r = 0; r < image.rows; ++r)
        for (int c = 0; c < image.cols; ++c) {
            int entry = firstEntry + (r / g.blockHeight) * g.blocksPerRow + c / g.blockWidth;
            bool absent = holes && image.absentBlocks.count(entry) != 0;
            appendBigEndian(out, absent ? 0 : source(band, r, c), bytes);
        }
    return out;
}

namespace detail {

void checkImage(const Image& image, Family family) {
    auto fail = [](const std::string& what) { throw std::invalid_argument("nitfsample: " + what); };
    if (image.rows < 1 || image.cols < 1 || image.bands < 1)
        fail("an image needs at least one row, column and band");
    if (image.nbpp < 1 || image.nbpp > 64 || (image.nbpp % 8 != 0 && image.nbpp > 56))
        fail("NBPP must be 1 to 56, or 64");
    if (image.nppbh < 0 || image.nppbv < 0)
        fail("NPPBH and NPPBV must not be negative");
    if (family == Family::V20 && image.bands > 9)
        fail("NITF 2.0 images have at most 9 bands");
    const bool knownMode =
        image.imode == 'B' || image.imode == 'P' || image.imode == 'R' || image.imode == 'S';
    if (!knownMode && (image.blockData.empty() || isMasked(image)))
        fail("IMODE must be B, P, R or S");
    if (!isMasked(image))
        return;
    const int count = blockEntryCount(image);
    if (!image.blockData.empty() && static_cast<int>(image.blockData.size()) != count)
        fail("a masked image needs one blockData element per block entry");
    if (!image.blockMaskRecords && !image.absentBlocks.empty())
        fail("absent blocks need block mask records");
    for (const std::set<int>* entries : {&image.absentBlocks, &image.padBlocks})
        if (!entries->empty() && (*entries->begin() < 0 || *entries->rbegin() >= count))
            fail("a block entry index is out of range");
    if (image.padCodeBits < 0 || image.padCodeBits > 64)
        fail("TPXCDLNTH must be 0 to 64");
}

uint64_t imageDataLength(const Image& image) {
    std::vector<uint64_t> sizes = entrySizes(image);
    uint64_t length = isMasked(image) ? maskRecord(image, sizes).size() : 0;
    for (std::size_t e = 0; e < sizes.size(); ++e)
        if (!isMasked(image) || image.absentBlocks.count(static_cast<int>(e)) == 0)
            length += sizes[e];
    return length;
}

void writeImageData(const Image& image, Sink& sink) {
    const bool masked = isMasked(image);
    if (masked)
        sink.put(maskRecord(image, entrySizes(image)));
    if (!image.blockData.empty()) {
        for (std::size_t e = 0; e < image.blockData.size(); ++e)
            if (!masked || image.absentBlocks.count(static_cast<int>(e)) == 0)
                sink.put(image.blockData[e]);
        return;
    }
    const Geometry g = geometry(image);
    const SampleSource source(image);
    BlockPacker packer(sink, image.nbpp);
    const int count = blockEntryCount(image);
    for (int e = 0; e < count; ++e)
        if (!masked || image.absentBlocks.count(e) == 0)
            packEntry(image, g, source, e, packer);
    packer.drain();
}

} // namespace detail

} // namespace nitfsample
