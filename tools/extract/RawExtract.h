// The canonical raw form of an image window, decoded through the library's region reader: the nitf tool's
// "extract -f raw" and the conformance tests share this code, so that the tests check exactly what the tool
// writes. The form: for each band chosen, in order, the window's rows top first, each sample in
// ceil(NBPP / 8) bytes, big-endian, as stored (no LUT, no scaling, no ABPP shift); 0 or 1 for NBPP 1.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace nitfextract {

struct Window {
    int x = 0, y = 0, width = 0, height = 0; // width 0: the whole image
};

struct Request {
    std::string path;       // the NITF file
    int image = 0;          // image segment, 0-based
    Window window;          // part of the image (NCOLS x NROWS)
    std::vector<int> bands; // 0-based; empty: every band
    int threads = 1;        // decoding threads, each with its own reader of the file
    int level = 0;          // resolution level (the window is at that level); see CNitfRegionReader::setLevel
};

struct Outcome {
    long long bytes = 0;  // written
    int absentBlocks = 0; // blocks the file records as absent (zeros)
    int failedBlocks = 0; // blocks that could not be decoded (zeros)
    std::string firstError;
};

// Told how many of `total` pieces are done; called from one thread at a time.
using Progress = std::function<void(long long done, long long total)>;

// The window with its defaults filled in, checked against the image (raises vexo::Exception).
Window resolveWindow(const Window& window, int width, int height);

// Writes the raw form of the request to `fd`. A regular file is written in place, each piece of the image at
// its own offset, by `threads` threads; anything else (a pipe) gets several bands the same way through an
// unlinked scratch file in $TMPDIR (streamed band after band on this thread when none can be made), one band
// streamed.
// Raises vexo::Exception or std::runtime_error when the image cannot be read or the output written.
Outcome writeRaw(const Request& request, int fd, const Progress& progress = Progress());

} // namespace nitfextract
