// Netpbm: P5 (grey) or P6 (colour), 8 or 16 bits.
#include <stdexcept>
#include <string>

#include "PictureWriter.h"

namespace {

class PnmWriter : public PictureWriter {
public:
    PnmWriter(FILE* out, const PictureFormat& format) : m_out(out) {
        if (format.channels != 1 && format.channels != 3)
            throw std::runtime_error("a PGM/PPM picture holds grey or RGB pixels only");
        const int maxValue = format.depth == 16 ? 65535 : 255;
        const std::string header = std::string(format.channels == 3 ? "P6" : "P5") + "\n" +
                                   std::to_string(format.width) + " " + std::to_string(format.height) + "\n" +
                                   std::to_string(maxValue) + "\n";
        put(header.data(), header.size());
        m_rowBytes = static_cast<size_t>(format.width) * format.channels * (format.depth == 16 ? 2 : 1);
    }
    void row(const unsigned char* samples) override { put(samples, m_rowBytes); }
    void finish() override {}

private:
    void put(const void* data, size_t size) {
        if (std::fwrite(data, 1, size, m_out) != size)
            throw std::runtime_error("cannot write the picture");
    }

    FILE* m_out;
    size_t m_rowBytes = 0;
};

} // namespace

std::unique_ptr<PictureWriter> makePnmWriter(FILE* out, const PictureFormat& format) {
    return std::make_unique<PnmWriter>(out, format);
}
