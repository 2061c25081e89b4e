// PNG through libpng.
#include <csetjmp>
#include <stdexcept>
#include <string>

#include <png.h>

#include "PictureWriter.h"

namespace {

class PngWriter : public PictureWriter {
public:
    PngWriter(FILE* out, const PictureFormat& format) {
        m_png = png_create_write_struct(PNG_LIBPNG_VER_STRING, this, onError, nullptr);
        m_info = m_png ? png_create_info_struct(m_png) : nullptr;
        if (!m_info)
            throw std::runtime_error("cannot start a PNG file");
        const bool paletted = !format.palette.empty();
        static const int types[] = {PNG_COLOR_TYPE_GRAY, PNG_COLOR_TYPE_GRAY_ALPHA, PNG_COLOR_TYPE_RGB,
                                    PNG_COLOR_TYPE_RGB_ALPHA};
        const int type = paletted ? PNG_COLOR_TYPE_PALETTE : types[(format.channels - 1) & 3];
        std::vector<png_color> colours(format.palette.size() / 3);
        for (size_t i = 0; i < colours.size(); ++i)
            colours[i] = {format.palette[3 * i], format.palette[3 * i + 1], format.palette[3 * i + 2]};
        // Entries up to the transparent one are opaque; the transparent one is not.
        std::vector<png_byte> alpha;
        if (paletted && format.transparentIndex >= 0 &&
            static_cast<size_t>(format.transparentIndex) < colours.size()) {
            alpha.assign(static_cast<size_t>(format.transparentIndex) + 1, 255);
            alpha.back() = 0;
        }
        guard([&] {
            png_init_io(m_png, out);
            png_set_IHDR(m_png, m_info, format.width, format.height, format.depth, type, PNG_INTERLACE_NONE,
                         PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
            if (paletted)
                png_set_PLTE(m_png, m_info, colours.data(), static_cast<int>(colours.size()));
            if (!alpha.empty())
                png_set_tRNS(m_png, m_info, alpha.data(), static_cast<int>(alpha.size()), nullptr);
            png_write_info(m_png, m_info);
            if (format.depth < 8)
                png_set_packing(m_png);
        });
    }
    ~PngWriter() override { png_destroy_write_struct(&m_png, &m_info); }

    void row(const unsigned char* samples) override {
        guard([&] { png_write_row(m_png, const_cast<unsigned char*>(samples)); });
    }
    void finish() override {
        guard([&] { png_write_end(m_png, m_info); });
    }

private:
    // libpng reports errors by longjmp; they are turned into exceptions at this one place. The bodies hold no
    // objects that need destroying.
    template <typename Body> void guard(Body body) {
        if (setjmp(png_jmpbuf(m_png)))
            throw std::runtime_error("PNG: " + m_error);
        body();
    }
    static void onError(png_structp png, png_const_charp message) {
        static_cast<PngWriter*>(png_get_error_ptr(png))->m_error = message ? message : "error";
        png_longjmp(png, 1);
    }

    std::string m_error;
    png_structp m_png = nullptr;
    png_infop m_info = nullptr;
};

} // namespace

std::unique_ptr<PictureWriter> makePngWriter(FILE* out, const PictureFormat& format) {
    return std::make_unique<PngWriter>(out, format);
}
