#include "J2kStreams.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>

#include <openjpeg.h>

#include "TestFiles.h"

namespace j2ktest {

namespace {

std::pair<int, int> samplingOf(const Coding& coding, int component) {
    return size_t(component) < coding.subsampling.size() ? coding.subsampling[size_t(component)]
                                                         : std::make_pair(1, 1);
}

int ceilDiv(int a, int b) {
    return (a + b - 1) / b;
}

} // namespace

std::pair<int, int> componentSize(const Coding& coding, int component) {
    const auto [dx, dy] = samplingOf(coding, component);
    return {ceilDiv(coding.x0 + coding.width, dx) - ceilDiv(coding.x0, dx),
            ceilDiv(coding.y0 + coding.height, dy) - ceilDiv(coding.y0, dy)};
}

Samples pattern(const Coding& coding) {
    const int precision = coding.precision;
    const bool isSigned = coding.isSigned;
    return [precision, isSigned](int component, int x, int y) {
        const uint32_t top = (1u << precision) - 1;
        uint32_t noise = uint32_t(x) * 73856093u ^ uint32_t(y) * 19349663u ^ uint32_t(component) * 83492791u;
        noise = (noise * 1103515245u + 12345u) >> 16;
        const uint32_t value = (uint32_t(x * 3 + y * 2 + component * 40) + noise % 16) % (top + 1);
        return isSigned ? int32_t(value) - int32_t(1u << (precision - 1)) : int32_t(value);
    };
}

std::string encode(const Coding& coding, const Samples& samples) {
    std::vector<opj_image_cmptparm_t> parameters(size_t(coding.components));
    for (int c = 0; c < coding.components; ++c) {
        opj_image_cmptparm_t& p = parameters[size_t(c)];
        std::memset(&p, 0, sizeof p);
        const auto [dx, dy] = samplingOf(coding, c);
        const auto [w, h] = componentSize(coding, c);
        p.dx = dx;
        p.dy = dy;
        p.w = w;
        p.h = h;
        p.x0 = coding.x0;
        p.y0 = coding.y0;
        p.prec = coding.precision;
        p.sgnd = coding.isSigned;
    }
    opj_image_t* image = opj_image_create(coding.components, parameters.data(),
                                          coding.components == 3 ? OPJ_CLRSPC_SRGB : OPJ_CLRSPC_GRAY);
    if (!image)
        throw std::runtime_error("opj_image_create failed");
    image->x0 = coding.x0;
    image->y0 = coding.y0;
    image->x1 = coding.x0 + coding.width;
    image->y1 = coding.y0 + coding.height;
    for (int c = 0; c < coding.components; ++c) {
        opj_image_comp_t& comp = image->comps[c];
        for (OPJ_UINT32 y = 0; y < comp.h; ++y)
            for (OPJ_UINT32 x = 0; x < comp.w; ++x)
                comp.data[y * comp.w + x] = samples(c, int(x), int(y));
    }

    opj_cparameters_t p;
    opj_set_default_encoder_parameters(&p);
    p.numresolution = coding.levels + 1;
    p.tcp_numlayers = 1;
    p.tcp_rates[0] = coding.lossless ? 0 : coding.ratio;
    p.cp_disto_alloc = 1;
    p.irreversible = coding.lossless ? 0 : 1;
    p.tcp_mct = coding.mct ? 1 : 0;
    p.image_offset_x0 = coding.x0;
    p.image_offset_y0 = coding.y0;
    if (coding.tileWidth > 0) {
        p.tile_size_on = OPJ_TRUE;
        p.cp_tdx = coding.tileWidth;
        p.cp_tdy = coding.tileHeight;
        p.cp_tx0 = coding.tileX0;
        p.cp_ty0 = coding.tileY0;
    }

    // Through a scratch file: OpenJPEG's own file streams.
    TempFile file("", ".j2k");
    opj_codec_t* codec = opj_create_compress(OPJ_CODEC_J2K);
    opj_stream_t* stream = opj_stream_create_default_file_stream(file.path().c_str(), OPJ_FALSE);
    const bool ok = opj_setup_encoder(codec, &p, image) && opj_start_compress(codec, image, stream) &&
                    opj_encode(codec, stream) && opj_end_compress(codec, stream);
    opj_stream_destroy(stream);
    opj_destroy_codec(codec);
    opj_image_destroy(image);
    if (!ok)
        throw std::runtime_error("JPEG 2000 encoding failed");
    return file.read();
}

Decoded decodeWhole(const std::string& codestream, int level) {
    TempFile file(codestream, ".j2k");
    opj_stream_t* stream = opj_stream_create_default_file_stream(file.path().c_str(), OPJ_TRUE);
    opj_codec_t* codec = opj_create_decompress(OPJ_CODEC_J2K);
    opj_dparameters_t parameters;
    opj_set_default_decoder_parameters(&parameters);
    parameters.cp_reduce = static_cast<OPJ_UINT32>(level);
    opj_image_t* image = nullptr;
    const bool ok = opj_setup_decoder(codec, &parameters) && opj_read_header(stream, codec, &image) &&
                    opj_decode(codec, stream, image) && opj_end_decompress(codec, stream);
    Decoded decoded;
    for (OPJ_UINT32 c = 0; ok && c < image->numcomps; ++c) {
        const opj_image_comp_t& comp = image->comps[c];
        decoded.components.push_back(
            Decoded::Component{int(comp.x0), int(comp.y0), int(comp.w), int(comp.h),
                               std::vector<int32_t>(comp.data, comp.data + comp.w * comp.h)});
    }
    if (image)
        opj_image_destroy(image);
    opj_destroy_codec(codec);
    opj_stream_destroy(stream);
    if (!ok)
        throw std::runtime_error("JPEG 2000 decoding failed");
    return decoded;
}

} // namespace j2ktest
