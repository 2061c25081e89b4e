#include "RawExtract.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <thread>

#include <sys/sendfile.h>
#include <sys/stat.h>
#include <unistd.h>

#include "HostError.h"
#include "HostFile.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfRegionReader.h"
#include "ScratchFile.h"

namespace nitfextract {

namespace {

// What one read may hold: large enough that reads and writes are few, small enough to stay in memory beside
// the blocks being decoded.
const size_t kReadBudget = 64u << 20;

// One piece of the window: rows [top, top + rows) of columns [left, left + cols), in image coordinates.
struct Piece {
    int top, rows, left, cols;
};

// An image opened on its own reader, for one thread.
struct OpenImage {
    explicit OpenImage(const Request& request) {
        if (!reader.open(request.path.c_str()))
            throw std::runtime_error("cannot open " + request.path);
        if (request.image < 0 || request.image >= reader.getImageCount())
            throw std::runtime_error("the file has " + std::to_string(reader.getImageCount()) +
                                     " image segment(s); there is no image " + std::to_string(request.image));
        source.reset(reader.getNewImageSource(request.image));
        region.reset(new CNitfRegionReader(&reader, source.get()));
        region->setBigEndian(true);
        region->setLevel(request.level);
    }
    CNitfFileReader reader;
    std::unique_ptr<CNitfImageSource> source;
    std::unique_ptr<CNitfRegionReader> region;
};

// The window cut into pieces along block rows (and, where a block row would be too large, along block
// columns or rows), so that no piece decodes a block another piece needs.
std::vector<Piece> cutWindow(const CNitfRegionReader& region, const CNitfImageSource& source,
                             const Window& window, int bands, bool fullRows) {
    // Pieces start on block rows (and columns) so that no two pieces decode the same block.
    const CNitfImagePropertiesIF& p = source.getImageProperties();
    int blockHeight = p.getTileHeight(), blockWidth = p.getTileWidth();
    int rowsPerRead = region.getRowsPerRead(window.width, bands, kReadBudget);
    if (region.getLevel() > 0) {
        // Reduced levels are read by area, not by block: rows that fit the budget, the whole width.
        const size_t row = std::max<size_t>(1, region.getBufferSize(window.width, 1, bands));
        blockHeight = rowsPerRead =
            static_cast<int>(std::max<size_t>(1, std::min<size_t>(kReadBudget / row, 1024)));
        blockWidth = window.width;
        fullRows = true;
    }
    int colsPerRead = window.width;
    if (!fullRows && rowsPerRead == blockHeight)
        colsPerRead =
            std::max(blockWidth, region.getColumnsPerRead(bands, kReadBudget) / blockWidth * blockWidth);
    std::vector<Piece> pieces;
    const int bottom = window.y + window.height, right = window.x + window.width;
    for (int top = window.y; top < bottom;) {
        const int blockEnd = std::min(bottom, (top / blockHeight + 1) * blockHeight);
        const int rows = std::min(blockEnd - top, rowsPerRead);
        for (int left = window.x; left < right;) {
            // Pieces after the first start on block columns.
            const int end = colsPerRead >= window.width
                                ? right
                                : std::min(right, (left / blockWidth) * blockWidth + colsPerRead);
            pieces.push_back({top, rows, left, end - left});
            left = end;
        }
        top += rows;
    }
    return pieces;
}

void writeAll(int fd, const unsigned char* data, size_t size, off_t offset, bool positioned) {
    while (size > 0) {
        const ssize_t done = positioned ? pwrite(fd, data, size, offset) : write(fd, data, size);
        if (done < 0 && errno == EINTR)
            continue;
        if (done <= 0)
            throw std::runtime_error(std::string("cannot write the output: ") + std::strerror(errno));
        data += done;
        size -= static_cast<size_t>(done);
        offset += done;
    }
}

// Copies `size` bytes of `in` at `from` to `out` (at `to` when positioned, else at its position): in the
// kernel where it can, through a buffer where it cannot (another file system, an old kernel).
void copyRange(int in, off_t from, int out, off_t to, size_t size, bool positioned) {
    while (size > 0) {
        const size_t chunk = std::min<size_t>(size, 1u << 30);
        const ssize_t done =
            positioned ? copy_file_range(in, &from, out, &to, chunk, 0) : sendfile(out, in, &from, chunk);
        if (done < 0 && errno == EINTR)
            continue;
        if (done <= 0)
            break;
        size -= static_cast<size_t>(done);
    }
    std::vector<unsigned char> buffer(std::min<size_t>(size, 1u << 20));
    while (size > 0) {
        const ssize_t got = pread(in, buffer.data(), std::min(size, buffer.size()), from);
        if (got < 0 && errno == EINTR)
            continue;
        if (got <= 0)
            throw std::runtime_error(std::string("cannot read the image data: ") +
                                     (got < 0 ? std::strerror(errno) : "the file ends early"));
        writeAll(out, buffer.data(), static_cast<size_t>(got), to, positioned);
        from += got;
        to += got;
        size -= static_cast<size_t>(got);
    }
}

// Where the stored bytes already are the raw form, the offset of the window's first row in each band: an
// uncompressed image of whole bytes per sample, without padding columns, whose blocks hold each band's
// rows one after another in the file. Empty when any block of the window breaks that (or is absent, or
// runs past the end of the file).
std::vector<off_t> storedBandStarts(OpenImage& image, const Window& window, const std::vector<int>& bands) {
    const CNitfImageSource& source = *image.source;
    const CNitfImagePropertiesIF& p = source.getImageProperties();
    const auto interleaving = p.getInterleavingType();
    const bool bandEntries = p.getBandCount() == 1 ||
                             interleaving == CNitfImagePropertiesIF::eBandSequential ||
                             interleaving == CNitfImagePropertiesIF::eBandInterleavedByBlock;
    if (image.region->getLevel() != 0 ||
        p.getCompressionType() != CNitfImagePropertiesIF::eCompressionUncompressed || p.getBpp() % 8 != 0 ||
        !bandEntries || p.getTileCountX() != 1 || p.getTileWidth() != p.getImageWidth() ||
        window.width != p.getImageWidth() || p.getTileHeight() <= 0 ||
        fileno(image.reader.getInputStream()) < 0)
        return {};
    const long long rowBytes = static_cast<long long>(p.getImageWidth()) * (p.getBpp() / 8);
    const long long blockBytes = rowBytes * p.getTileHeight();
    const long long fileSize = DKSize(image.reader.getInputStream());
    const int firstBlock = window.y / p.getTileHeight();
    const int lastBlock = (window.y + window.height - 1) / p.getTileHeight();
    std::vector<off_t> starts;
    for (int band : bands) {
        const unsigned long long first = source.getTileOffset(p.getTileIndex(0, firstBlock, band));
        for (int block = firstBlock; block <= lastBlock; ++block) {
            const unsigned long long offset = source.getTileOffset(p.getTileIndex(0, block, band));
            if (source.isBlockAbsent(0, block, band) || offset == 0 ||
                offset != first + static_cast<unsigned long long>(block - firstBlock) * blockBytes ||
                static_cast<long long>(offset) + blockBytes > fileSize)
                return {};
        }
        starts.push_back(static_cast<off_t>(first + (window.y % p.getTileHeight()) * rowBytes));
    }
    return starts;
}

// An unlinked file in $TMPDIR (or /tmp) when `wanted`; fd -1 when not wanted or it cannot be made.
struct ScratchFile {
    explicit ScratchFile(bool wanted) {
        if (!wanted)
            return;
        const char* dir = std::getenv("TMPDIR");
        fd = openUnlinkedFile(dir && *dir ? dir : "/tmp", "nitf-extract-");
    }
    ~ScratchFile() {
        if (fd >= 0)
            close(fd);
    }
    ScratchFile(const ScratchFile&) = delete;
    ScratchFile& operator=(const ScratchFile&) = delete;
    int fd = -1;
};

class Extraction {
public:
    Extraction(const Request& request, int fd, const Progress& progress)
        : m_request(request), m_fd(fd), m_progress(progress) {}

    Outcome run() {
        OpenImage first(m_request);
        m_window = resolveWindow(m_request.window, first.region->getWidth(), first.region->getHeight());
        m_bands = m_request.bands;
        if (m_bands.empty())
            for (int b = 0; b < first.region->getBandCount(); ++b)
                m_bands.push_back(b);
        for (int band : m_bands)
            if (band < 0 || band >= first.region->getBandCount())
                throw std::runtime_error("the image has " + std::to_string(first.region->getBandCount()) +
                                         " band(s); there is no band " + std::to_string(band));
        m_sampleBytes = first.region->getSampleBytes();
        m_rowBytes = static_cast<size_t>(m_window.width) * m_sampleBytes;
        m_planeBytes = m_rowBytes * m_window.height;

        struct stat info;
        const bool positioned = fstat(m_fd, &info) == 0 && S_ISREG(info.st_mode);
        m_base = positioned ? lseek(m_fd, 0, SEEK_CUR) : 0;
        m_outcome.bytes = static_cast<long long>(m_planeBytes * m_bands.size());
        const std::vector<off_t> stored = storedBandStarts(first, m_window, m_bands);
        if (!stored.empty()) {
            copyStored(first, stored, positioned);
            return m_outcome;
        }
        // Several bands to a pipe: streamed band after band, every block holding them all would be decoded
        // once per band. They are decoded once instead, in place into an unlinked scratch file (threads and
        // all), then streamed from it.
        const ScratchFile scratch(!positioned && m_bands.size() > 1);
        m_out = positioned ? m_fd : scratch.fd;
        m_pieces =
            cutWindow(*first.region, *first.source, m_window, static_cast<int>(m_bands.size()), m_out < 0);
        if (m_out < 0) {
            runStreamed(first);
            return m_outcome;
        }
        runInPlace(first);
        if (!positioned)
            copyRange(scratch.fd, 0, m_fd, 0, static_cast<size_t>(m_outcome.bytes), false);
        return m_outcome;
    }

private:
    // The stored bytes are the output: each band's rows copied from the file as they are, nothing decoded.
    void copyStored(OpenImage& image, const std::vector<off_t>& starts, bool positioned) {
        const int in = fileno(image.reader.getInputStream());
        for (size_t k = 0; k < starts.size(); ++k) {
            copyRange(in, starts[k], m_fd, m_base + static_cast<off_t>(k * m_planeBytes), m_planeBytes,
                      positioned);
            if (m_progress)
                m_progress(static_cast<long long>(k + 1), static_cast<long long>(starts.size()));
        }
    }

    // Every band of each piece from one read, each band's rows written at their place in the output.
    void runInPlace(OpenImage& first) {
        const int threads = std::max(1, std::min<int>(m_request.threads, static_cast<int>(m_pieces.size())));
        std::vector<std::thread> workers;
        for (int t = 1; t < threads; ++t)
            workers.emplace_back([this] { work(nullptr); });
        work(&first);
        for (std::thread& worker : workers)
            worker.join();
        if (m_error)
            std::rethrow_exception(m_error);
    }

    void work(OpenImage* given) {
        try {
            std::unique_ptr<OpenImage> own;
            OpenImage& image = given ? *given : *(own = std::make_unique<OpenImage>(m_request));
            std::vector<unsigned char> buffer;
            for (size_t i = m_next++; i < m_pieces.size() && !m_failed; i = m_next++) {
                const Piece& piece = m_pieces[i];
                buffer.resize(
                    image.region->getBufferSize(piece.cols, piece.rows, static_cast<int>(m_bands.size())));
                const CNitfRegionReader::Result result =
                    image.region->read(piece.left, piece.top, piece.cols, piece.rows, m_bands, buffer.data());
                writePiece(piece, buffer.data());
                finished(result);
            }
        } catch (...) {
            std::lock_guard<std::mutex> lock(m_mutex);
            if (!m_error)
                m_error = std::current_exception();
            m_failed = true;
        }
    }

    void writePiece(const Piece& piece, const unsigned char* data) {
        const size_t pieceRow = static_cast<size_t>(piece.cols) * m_sampleBytes;
        const size_t piecePlane = pieceRow * piece.rows;
        for (size_t k = 0; k < m_bands.size(); ++k) {
            const unsigned char* plane = data + k * piecePlane;
            const off_t start =
                m_base + static_cast<off_t>(k * m_planeBytes +
                                            static_cast<size_t>(piece.top - m_window.y) * m_rowBytes +
                                            static_cast<size_t>(piece.left - m_window.x) * m_sampleBytes);
            if (pieceRow == m_rowBytes) {
                writeAll(m_out, plane, piecePlane, start, true);
                continue;
            }
            for (int r = 0; r < piece.rows; ++r)
                writeAll(m_out, plane + r * pieceRow, pieceRow, start + static_cast<off_t>(r * m_rowBytes),
                         true);
        }
    }

    // Band after band, piece after piece, in output order.
    void runStreamed(OpenImage& image) {
        std::vector<unsigned char> buffer;
        for (int band : m_bands) {
            for (const Piece& piece : m_pieces) {
                buffer.resize(image.region->getBufferSize(piece.cols, piece.rows, 1));
                const CNitfRegionReader::Result result =
                    image.region->read(piece.left, piece.top, piece.cols, piece.rows, {band}, buffer.data());
                writeAll(m_fd, buffer.data(), buffer.size(), 0, false);
                finished(result, m_pieces.size() * m_bands.size());
            }
        }
    }

    void finished(const CNitfRegionReader::Result& result, size_t total = 0) {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_outcome.absentBlocks += result.absentBlocks;
        if (result.failedBlocks > 0 && m_outcome.failedBlocks == 0)
            m_outcome.firstError = result.firstError;
        m_outcome.failedBlocks += result.failedBlocks;
        ++m_done;
        if (m_progress)
            m_progress(m_done, static_cast<long long>(total ? total : m_pieces.size()));
    }

    const Request& m_request;
    int m_fd;
    int m_out = -1; // where pieces are written in place: the output, or a scratch file
    Progress m_progress;
    Window m_window;
    std::vector<int> m_bands;
    int m_sampleBytes = 1;
    size_t m_rowBytes = 0, m_planeBytes = 0;
    off_t m_base = 0;
    std::vector<Piece> m_pieces;
    std::atomic<size_t> m_next{0};
    std::atomic<bool> m_failed{false};
    std::mutex m_mutex;
    std::exception_ptr m_error;
    Outcome m_outcome;
    long long m_done = 0;
};

} // namespace

Window resolveWindow(const Window& window, int width, int height) {
    Window resolved = window;
    if (resolved.width == 0 && resolved.height == 0 && resolved.x == 0 && resolved.y == 0) {
        resolved.width = width;
        resolved.height = height;
    }
    if (resolved.x < 0 || resolved.y < 0 || resolved.width <= 0 || resolved.height <= 0 ||
        static_cast<long long>(resolved.x) + resolved.width > width ||
        static_cast<long long>(resolved.y) + resolved.height > height)
        throw std::runtime_error("the window " + std::to_string(window.x) + "," + std::to_string(window.y) +
                                 "," + std::to_string(window.width) + "," + std::to_string(window.height) +
                                 " does not lie inside the image (" + std::to_string(width) + " x " +
                                 std::to_string(height) + " pixels)");
    return resolved;
}

Outcome writeRaw(const Request& request, int fd, const Progress& progress) {
    Extraction extraction(request, fd, progress);
    return extraction.run();
}

} // namespace nitfextract
