// Fits a decoded JPEG stream whose size differs from its block (downsampled "I1" blocks, odd producers) to
// the block: rows and columns are picked through index maps, enlarging by the NITF replication rule and
// reducing by nearest neighbour. Source rows are taken one at a time, in order, so no whole-stream buffer is
// needed.
#pragma once

#include <vector>

class CBlockResampler {
public:
    // `components` samples of `sampleBytes` bytes (1 or 2) make a pixel.
    CBlockResampler(int sourceWidth, int sourceHeight, int width, int height, int components,
                    int sampleBytes);

    // The source index for each of `destination` entries taken from `source` entries. Enlarging replicates
    // by the rule NITF downsampled images were made for (each source entry covers about destination / source
    // entries, the first one entry more); reducing takes entry floor(i * source / destination). The result
    // never points past the last source entry.
    static std::vector<int> indexMap(int destination, int source);

    // Produces every destination row that comes from source row `sourceRow` (rows arrive in order, each
    // exactly once) into `destination`, whose rows lie `rowBytes` apart.
    void putSourceRow(int sourceRow, const unsigned char* row, unsigned char* destination,
                      int rowBytes) const;

private:
    void resampleRow(const unsigned char* source, unsigned char* destination) const;

    int m_sourceWidth;
    int m_width;
    int m_components;
    int m_sampleBytes;
    std::vector<int> m_columns;
    std::vector<int> m_rows;
};
