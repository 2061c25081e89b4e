// JPEG 2000 codestreams made with OpenJPEG's encoder, for tests and benchmarks that need images of a chosen
// shape: tiles, offsets, sub-sampled or signed components, lossless or lossy.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace j2ktest {

struct Coding {
    int width = 64; // of the image area on the reference grid
    int height = 64;
    int components = 1;
    int precision = 8;
    bool isSigned = false;
    std::vector<std::pair<int, int>> subsampling; // per component; missing: 1 x 1
    int x0 = 0, y0 = 0;                           // image offset
    int tileWidth = 0, tileHeight = 0;            // 0: one tile
    int tileX0 = 0, tileY0 = 0;
    int levels = 5;
    bool lossless = true; // 5-3 reversible; otherwise 9-7 at `ratio`:1
    float ratio = 20;
    bool mct = false;
};

// The value of component `component` at (x, y) of its own sampling grid (0-based from its first sample).
using Samples = std::function<int32_t(int component, int x, int y)>;

// A smooth pattern with some texture, within the precision and sign of `coding`.
Samples pattern(const Coding& coding);

// The codestream of the image.
std::string encode(const Coding& coding, const Samples& samples);

// The size of component `component` on its grid.
std::pair<int, int> componentSize(const Coding& coding, int component);

} // namespace j2ktest

namespace j2ktest {

// Components decoded whole by OpenJPEG (reduced `level` times), as an independent route to compare with.
struct Decoded {
    struct Component {
        int x0 = 0, y0 = 0, width = 0, height = 0; // x0, y0: absolute on the component's reduced grid
        std::vector<int32_t> samples;
    };
    std::vector<Component> components;
};
Decoded decodeWhole(const std::string& codestream, int level);

} // namespace j2ktest
