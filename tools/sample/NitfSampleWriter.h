// An independent writer of small NITF files. It is built on the standard library alone and shares no code
// with libnitf, so tests can check the reader against files laid out from first principles, benchmarks can
// generate large images quickly, and the CLI can produce its demo sample.
//
// Fill the plain structs below (every member has a usable default) and call build() or write(). The writer
// computes every length field itself. Any field can still be forced to an odd value through the `fields` map
// of the struct that owns it: the map's key is the field's name (FTITLE, NROWS, IREPBAND2, DESSHL, ...), the
// value is written instead of the computed one, cut or space-padded to the field's width. Overrides change
// the bytes only, never the layout: a conditional field appears or not according to the struct members.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace nitfsample {

// A tagged record extension: the tag is blank-padded to 6 characters, CEL is data.size().
struct Tre {
    std::string tag;
    std::string data;
};

// Field values that replace what the writer would put there, by field name.
using Overrides = std::map<std::string, std::string>;

// A security field group. NITF 2.1, NSIF and OSDE use the 16 fields from clas to ctln (167 bytes). NITF 2.0
// uses clas, code, ctlh, rel, caut, ctln and dwng, plus devt when dwng is "999998". Field names take the
// prefix of the owner: FSCLAS (file), ISCLAS (image), SSCLAS (graphic), LSCLAS (label), TSCLAS (text),
// DESCLAS, RESCLAS.
struct Security {
    std::string clas = "U";
    std::string clsy, code, ctlh, rel, dctp, dcdt, dcxm, dg, dgdt, cltx, catp, caut, crsn, srdt, ctln;
    std::string dwng, devt; // NITF 2.0 only
};

// Per-band fields of an image. An empty irepband is derived from IREP (R/G/B for RGB, LU for RGB/LUT, M for
// MONO, Y/Cb/Cr for YCbCr601, blank otherwise).
struct Band {
    std::string irepband;
    std::string isubcat;
    std::vector<std::string> luts; // NLUTS tables, each of NELUT bytes (all the same length)
};

struct Image {
    std::string iid1 = "SAMPLE"; // IID in NITF 2.0
    std::string idatim;          // empty: a fixed date in the version's form
    std::string tgtid;
    std::string iid2;  // ITITLE in NITF 2.0
    std::string iinfo; // OSDE only, in place of TGTID and IID2
    Security security; // OSDE writes the 2.1 group as the one 167-byte field ISCSEC
    std::string isorce;
    int rows = 64;
    int cols = 64;
    int bands = 1;
    int nbpp = 8;
    int abpp = 0; // 0: same as nbpp
    std::string pvtype = "INT";
    std::string irep; // empty: MONO for one band, RGB for three, MULTI otherwise
    std::string icat = "VIS";
    char pjust = 'R';
    char icords = 0;                   // 0: no coordinates (written as a space in 2.1, as 'N' in 2.0)
    std::string igeolo;                // 60 characters, written when icords gives coordinates
    std::vector<std::string> comments; // ICOMn, 80 characters each
    std::string ic = "NC";
    std::string comrat;         // written for the codes that carry COMRAT
    std::vector<Band> bandInfo; // per band; missing entries take the defaults
    int isync = 0;
    char imode = 'B';
    int nppbh = 0; // 0: one block spans the image's width (written as 0000)
    int nppbv = 0; // 0: one block spans the image's height
    int idlvl = 1;
    int ialvl = 0;
    std::string iloc = "0000000000";
    std::string imag = "1.0";
    std::vector<Tre> udid, ixshd;
    int udofl = 0,
        ixsofl = 0; // overflow DES numbers (the area is written when it has TREs or an overflow number)

    // Pixel content: sample(band, row, col), masked to NBPP bits by the writer. Empty: defaultPattern.
    std::function<uint64_t(int band, int row, int col)> sample;
    uint64_t padValue = 0; // fills partial blocks at the right and bottom; also TPXCD of masked images
    // Pre-built bytes per block entry (e.g. JPEG streams), written instead of samples. For masked images
    // there is one element per block entry (see blockEntryCount); absent entries are skipped.
    std::vector<std::string> blockData;

    // Masked images (IC "NM" or starting with 'M'): the block mask record precedes the blocks.
    std::set<int> absentBlocks; // block entry indexes that are not written (0xFFFFFFFF in the mask)
    bool blockMaskRecords =
        true;                    // BMRLNTH 4 and the block offsets; false: BMRLNTH 0 (needs no absent blocks)
    bool padMaskRecords = false; // TMRLNTH 4 and the pad pixel mask
    std::set<int> padBlocks;     // entries marked in the pad pixel mask as holding pad pixels
    int padCodeBits = 0;         // TPXCDLNTH; TPXCD is padValue in ceil(bits / 8) bytes

    Overrides fields;
};

// A 2.1 graphic or a 2.0 symbol.
struct Graphic {
    std::string sid = "GRAPHIC";
    std::string sname;
    Security security;
    char sfmt = 'C'; // SFMT in 2.1, STYPE in 2.0
    int sdlvl = 1;
    int salvl = 0;
    std::string sloc = "0000000000";
    std::string sbnd1 = "0000000000"; // 2.1 only
    char scolor = 'C';
    std::string sbnd2 = "0000000000"; // 2.1 only
    // NITF 2.0 symbol fields
    int nlips = 0, npixpl = 0, nwdth = 0, nbpp = 0;
    std::string sloc2 = "0000000000";
    std::string snum = "000000";
    int srot = 0;
    int nelut = 0;
    std::string dlut; // the symbol LUT bytes, written when nelut is not 0
    std::string data;
    std::vector<Tre> tres; // SXSHD
    int sxsofl = 0;
    Overrides fields;
};

// A NITF 2.0 label.
struct Label {
    std::string lid = "LABEL";
    Security security;
    char lfs = ' ';
    int lcw = 0, lch = 0;
    int ldlvl = 1, lalvl = 0;
    std::string lloc = "0000000000";
    std::string ltc = std::string(3, '\x01'); // text colour R, G, B
    std::string lbc = std::string(3, '\0');   // background colour
    std::string data;
    std::vector<Tre> tres; // LXSHD
    int lxsofl = 0;
    Overrides fields;
};

struct Text {
    std::string textid = "TEXT"; // 7 characters in 2.1, 10 in 2.0
    int txtalvl = 0;             // 2.1 only
    std::string txtdt;           // empty: a fixed date in the version's form
    std::string txtitl;
    Security security;
    std::string txtfmt = "STA";
    std::string data;
    std::vector<Tre> tres; // TXSHD
    int txsofl = 0;
    Overrides fields;
};

// A data extension segment. DESOFLW and DESITEM are written when desid names an overflow DES of the file's
// version ("TRE_OVERFLOW"; in 2.0 "Registered Extensions" or "Controlled Extensions").
struct Des {
    std::string desid; // DESTAG in 2.0
    int desver = 1;
    Security security; // OSDE writes the 2.1 group as the one 167-byte field DESSEC
    std::string desoflw;
    int desitem = 0;
    std::string desshf;
    std::string data;
    Overrides fields;
};

struct Res {
    std::string resid; // RESTAG in 2.0
    int resver = 1;
    Security security;
    std::string resshf;
    std::string data;
    Overrides fields;
};

struct File {
    std::string version = "NITF02.10"; // or "NSIF01.00", "OSDE01.00", "NITF02.00"
    std::string clevel = "03";
    std::string stype; // empty: "BF01" for the 2.1 family, blank for 2.0
    std::string ostaid = "NITFSAMPLE";
    std::string fdt; // empty: a fixed date in the version's form
    std::string ftitle;
    Security security;
    int fscop = 0, fscpys = 0;
    std::string fbkgc = std::string(3, '\0'); // 2.1/NSIF: three binary bytes R, G, B
    std::string oname;                        // 24 characters (27 in 2.0)
    std::string ophone;
    std::string oid; // OSDE only, 45 characters in place of FBKGC, ONAME and OPHONE
    std::vector<Tre> udhd, xhd;
    int udhofl = 0, xhdlofl = 0;
    // Writes FL and every LI as nines and appends a STREAMING_FILE_HEADER DES carrying the real header.
    bool streaming = false;
    std::vector<Image> images;
    std::vector<Graphic> graphics;
    std::vector<Label> labels; // NITF 2.0 only
    std::vector<Text> texts;
    std::vector<Des> des;
    std::vector<Res> res;
    Overrides fields;
};

// The whole file in memory.
std::string build(const File& file);
// Streams the file to `path`, block by block; throws std::runtime_error on I/O failure.
void write(const File& file, const std::string& path);
// A small, good-looking NITF 2.1 demo: a 256 x 256 RGB image in 128 x 128 blocks with geographic corners, a
// file TRE, an image comment and a text segment.
File defaultSample();

// A DES carrying overflowed TREs of `area` ("UDHD", "XHD", "UDID", "IXSHD", "SXSHD", "LXSHD", "TXSHD") of
// segment `item` (0 for the file header). For NITF 2.0 the DESTAG is "Registered Extensions" (UDHD, UDID) or
// "Controlled Extensions" (the other areas), else "TRE_OVERFLOW".
Des treOverflow(const std::string& area, int item, const std::vector<Tre>& tres,
                const std::string& version = "NITF02.10");
// A STREAMING_FILE_HEADER DES whose data carries the replacement file header.
Des streamingFileHeader(const std::string& replacementHeaderBytes);
// The bytes of a run of TREs (tag, CEL, data each).
std::string treBytes(const std::vector<Tre>& tres);

// Blocking geometry of an image as the writer lays it out.
struct Geometry {
    int blockWidth = 0;         // NPPBH, or NCOLS when NPPBH is 0
    int blockHeight = 0;        // NPPBV, or NROWS when NPPBV is 0
    int blocksPerRow = 0;       // NBPR
    int blocksPerColumn = 0;    // NBPC
    uint64_t tileBandBytes = 0; // ceil(blockWidth * blockHeight * NBPP / 8)
    uint64_t tileBytes = 0;     // bands * tileBandBytes
};
Geometry geometry(const Image& image);
// Block entries: NBPR * NBPC * bands for IMODE S, NBPR * NBPC otherwise.
int blockEntryCount(const Image& image);
// The pattern used when Image::sample is empty (not yet masked to NBPP bits).
uint64_t defaultPattern(int band, int row, int col);
// The value the writer stores for (band, row, col) of the image, masked to NBPP bits.
uint64_t sampleAt(const Image& image, int band, int row, int col);
// One band (0-based) in canonical form: NROWS x NCOLS samples, ceil(NBPP / 8) bytes big-endian each (one byte
// 0/1 for NBPP 1). Samples of absent blocks read as 0. Throws std::logic_error for images given as blockData.
std::string canonicalBand(const Image& image, int band);

} // namespace nitfsample
