// One libjpeg decompression object, reused for stream after stream: it reads a JPEG stream from a bounded
// range of a C stream, supplies the NITF default tables for streams that lack them, picks up the NITF
// amplitude-mapping application marker, and turns libjpeg's errors into vexo::Exception.
//
// libjpeg reports a fatal error by a call that must not return. Here that call long-jumps back into a small
// guard function whose frame (and every frame libjpeg runs in below it) holds no C++ object with a
// destructor; the exception is thrown only once the guard has returned. After an error the object is reset,
// so the next stream decodes normally.
#pragma once

#include <csetjmp>
#include <cstdio>
#include <vector>

#include <jpeglib.h>

class CJpegStreamDecoder {
public:
    // Default quantisation tables 1 to 5 have 64 values each.
    static const int kQuantValues = 64;

    CJpegStreamDecoder();
    ~CJpegStreamDecoder();
    CJpegStreamDecoder(const CJpegStreamDecoder&) = delete;
    CJpegStreamDecoder& operator=(const CJpegStreamDecoder&) = delete;

    // The default quantisation table (1 to 5) given to streams without one of their own; 0 gives none.
    void setDefaultQuality(int quality);
    // The 64 values of default table `quality` (1 to 5), or null.
    static const unsigned short* defaultQuantTable(int quality);

    // Starts on the stream of `length` bytes at `offset` and reads its header; an unfinished earlier stream
    // is dropped. Raises vexo::Exception when the header is damaged or holds no image.
    void readHeader(FILE* fp, unsigned long long offset, unsigned long long length);

    int width() const { return static_cast<int>(m_cinfo.image_width); }
    int height() const { return static_cast<int>(m_cinfo.image_height); }
    int precision() const { return m_cinfo.data_precision; }
    int components() const { return m_cinfo.num_components; }
    // Bytes of one decoded sample: 1 up to 8-bit precision, else 2 (native byte order).
    int sampleBytes() const { return m_cinfo.data_precision <= 8 ? 1 : 2; }
    J_COLOR_SPACE streamColorSpace() const { return m_cinfo.jpeg_color_space; }
    // Whether the stream's own markers (JFIF, or Adobe with transform 1) say its components are YCbCr.
    bool markedYCbCr() const {
        return m_cinfo.saw_JFIF_marker || (m_cinfo.saw_Adobe_marker && m_cinfo.Adobe_transform == 1);
    }
    // Overrides libjpeg's guess of the stream's colour space and sets the colour space it delivers.
    void setColorSpaces(J_COLOR_SPACE stream, J_COLOR_SPACE output);

    // Between readHeader and readRows: sizes the output. Raises vexo::Exception on failure.
    void start();
    int outputComponents() const { return m_cinfo.output_components; }
    // Decodes the next `count` rows, each into its own pointer (samples of sampleBytes() each). Raises
    // vexo::Exception when the stream is damaged beyond decoding.
    void readRows(unsigned char** rows, int count);
    // Ends the stream. Trailing damage after the last row costs nothing: every row has been delivered.
    void finish();

    // Whether the last header carried a "NITF0001.A" application marker, and the amplitude offset it gave.
    bool sawAmplitudeMarker() const { return m_sawAmplitudeMarker; }
    unsigned short amplitudeOffset() const { return m_amplitudeOffset; }

private:
    // The error manager: libjpeg's, with the jump target of the guard that is active.
    struct ErrorManager {
        jpeg_error_mgr pub;
        jmp_buf jump;
    };
    // A source manager reading at most `remaining` bytes from a C stream.
    struct FileSource {
        jpeg_source_mgr pub;
        FILE* fp;
        unsigned long long remaining;
        unsigned char* buffer;
    };

    // The guarded steps: false when libjpeg raised an error (its text is then in m_message).
    bool guardedCreate();
    bool guardedReadHeader();
    bool guardedStart();
    bool guardedReadRows(unsigned char** rows, int count);
    bool guardedFinish();
    // Resets the object after an error and raises the error's text.
    [[noreturn]] void fail(const char* signature);
    void installDefaultTables();
    void decodeRows(unsigned char** rows, int count);

    static void onError(j_common_ptr cinfo);
    static void onMessage(j_common_ptr cinfo, int level);
    // Called between scans of a multi-scan stream: stops streams with absurdly many scans.
    static void onProgress(j_common_ptr cinfo);
    static void initSource(j_decompress_ptr cinfo);
    static boolean fillInput(j_decompress_ptr cinfo);
    static void skipInput(j_decompress_ptr cinfo, long count);
    static void termSource(j_decompress_ptr cinfo);
    static boolean readApplicationMarker(j_decompress_ptr cinfo);

    jpeg_decompress_struct m_cinfo;
    ErrorManager m_errors;
    FileSource m_source;
    jpeg_progress_mgr m_progress;
    std::vector<unsigned char> m_inputBuffer;
    char m_message[JMSG_LENGTH_MAX];
    int m_quality;
    bool m_sawAmplitudeMarker;
    unsigned short m_amplitudeOffset;
};
