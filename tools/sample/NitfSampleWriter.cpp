// The file header, the order of segments, and the two outputs (memory and file) of the sample writer.
#include "NitfSampleWriter.h"
#include "SampleInternal.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <stdexcept>

namespace nitfsample {

using detail::Family;
using detail::Fields;

namespace {

struct Segment {
    std::string subheader;
    uint64_t dataLength;
};

// Everything that is known before the first byte is written.
struct Plan {
    Family family = Family::V21;
    std::vector<Segment> images, graphics, labels, texts, des, res;
    std::vector<Des> extraDes; // the streaming file header, when asked for
    std::string header;        // the file header as written first
    uint64_t fileLength = 0;
};

std::string digits(uint64_t value, std::size_t width) {
    std::string text = std::to_string(value);
    return std::string(width > text.size() ? width - text.size() : 0, '0') + text;
}

void segmentTable(Fields& f, const std::string& countName, const std::string& headerName,
                  std::size_t headerWidth, const std::string& dataName, std::size_t dataWidth,
                  const std::vector<Segment>& segments, bool unknownDataLengths = false) {
    f.number(countName, segments.size(), 3);
    for (std::size_t i = 0; i < segments.size(); ++i) {
        std::string n = std::to_string(i + 1);
        f.number(headerName + n, segments[i].subheader.size(), headerWidth);
        if (unknownDataLengths)
            f.text(dataName + n, std::string(dataWidth, '9'), dataWidth);
        else
            f.number(dataName + n, segments[i].dataLength, dataWidth);
    }
}

// The file header. With `streamingForm`, FL and the image data lengths are written as nines.
std::string fileHeader(const File& file, const Plan& plan, uint64_t headerLength, uint64_t fileLength,
                       bool streamingForm) {
    const bool v20 = plan.family == Family::V20;
    Fields f(file.fields);
    f.text("FHDR", file.version, 9);
    f.text("CLEVEL", file.clevel, 2);
    f.text("STYPE", file.stype.empty() && !v20 ? "BF01" : file.stype, 4);
    f.text("OSTAID", file.ostaid, 10);
    f.text("FDT", file.fdt.empty() ? detail::defaultDate(plan.family) : file.fdt, 14);
    f.text("FTITLE", file.ftitle, 80);
    f.security(plan.family, "F", file.security);
    f.number("FSCOP", file.fscop, 5);
    f.number("FSCPYS", file.fscpys, 5);
    f.text("ENCRYP", "0", 1);
    if (v20) {
        f.text("ONAME", file.oname, 27);
        f.text("OPHONE", file.ophone, 18);
    } else if (plan.family == Family::Osde) {
        f.text("OID", file.oid, 45);
    } else {
        std::string colour = file.fbkgc.substr(0, 3);
        colour.resize(3, '\0');
        f.binary("FBKGC", colour);
        f.text("ONAME", file.oname, 24);
        f.text("OPHONE", file.ophone, 18);
    }
    if (streamingForm)
        f.text("FL", std::string(12, '9'), 12);
    else
        f.number("FL", fileLength, 12);
    f.number("HL", headerLength, 6);
    segmentTable(f, "NUMI", "LISH", 6, "LI", 10, plan.images, streamingForm);
    segmentTable(f, "NUMS", "LSSH", 4, "LS", 6, plan.graphics);
    if (v20)
        segmentTable(f, "NUML", "LLSH", 4, "LL", 3, plan.labels);
    else
        f.text("NUMX", "000", 3);
    segmentTable(f, "NUMT", "LTSH", 4, "LT", 5, plan.texts);
    segmentTable(f, "NUMDES", "LDSH", 4, "LD", 9, plan.des);
    segmentTable(f, "NUMRES", "LRESH", 4, "LRE", 7, plan.res);
    f.treArea("UDHDL", "UDHOFL", file.udhd, file.udhofl);
    f.treArea("XHDL", "XHDLOFL", file.xhd, file.xhdlofl);
    return f.bytes();
}

Plan makePlan(const File& file) {
    Plan plan;
    plan.family = detail::familyOf(file.version);
    if (plan.family != Family::V20 && !file.labels.empty())
        throw std::invalid_argument("nitfsample: labels exist only in NITF 2.0");
    for (const Image& image : file.images) {
        detail::checkImage(image, plan.family);
        plan.images.push_back({detail::imageSubheader(image, plan.family), detail::imageDataLength(image)});
    }
    for (const Graphic& graphic : file.graphics)
        plan.graphics.push_back({detail::graphicSubheader(graphic, plan.family), graphic.data.size()});
    for (const Label& label : file.labels)
        plan.labels.push_back({detail::labelSubheader(label), label.data.size()});
    for (const Text& text : file.texts)
        plan.texts.push_back({detail::textSubheader(text, plan.family), text.data.size()});
    for (const Des& des : file.des)
        plan.des.push_back({detail::desSubheader(des, plan.family), des.data.size()});
    for (const Res& res : file.res)
        plan.res.push_back({detail::resSubheader(res, plan.family), res.data.size()});

    // The streaming header's DES is part of the replacement header it carries; its data length depends only
    // on the header length, which does not depend on the values written.
    if (file.streaming)
        plan.des.push_back({detail::desSubheader(streamingFileHeader(""), plan.family), 0});
    const uint64_t headerLength = fileHeader(file, plan, 0, 0, false).size();
    if (file.streaming)
        plan.des.back().dataLength = streamingFileHeader(std::string(headerLength, ' ')).data.size();

    uint64_t length = headerLength;
    for (const auto* segments :
         {&plan.images, &plan.graphics, &plan.labels, &plan.texts, &plan.des, &plan.res})
        for (const Segment& segment : *segments)
            length += segment.subheader.size() + segment.dataLength;
    plan.fileLength = length;
    plan.header = fileHeader(file, plan, headerLength, length, false);
    if (file.streaming) {
        plan.extraDes.push_back(streamingFileHeader(plan.header));
        plan.header = fileHeader(file, plan, headerLength, length, true);
    }
    return plan;
}

void emit(const File& file, const Plan& plan, detail::Sink& sink) {
    sink.put(plan.header);
    for (std::size_t i = 0; i < file.images.size(); ++i) {
        sink.put(plan.images[i].subheader);
        detail::writeImageData(file.images[i], sink);
    }
    auto putAll = [&sink](const auto& items, const std::vector<Segment>& segments) {
        for (std::size_t i = 0; i < items.size(); ++i) {
            sink.put(segments[i].subheader);
            sink.put(items[i].data);
        }
    };
    putAll(file.graphics, plan.graphics);
    putAll(file.labels, plan.labels);
    putAll(file.texts, plan.texts);
    std::vector<Des> allDes = file.des;
    allDes.insert(allDes.end(), plan.extraDes.begin(), plan.extraDes.end());
    putAll(allDes, plan.des);
    putAll(file.res, plan.res);
}

class StringSink : public detail::Sink {
public:
    explicit StringSink(std::string& out) : out_(out) {}
    void put(const char* data, std::size_t size) override { out_.append(data, size); }

private:
    std::string& out_;
};

class FileSink : public detail::Sink {
public:
    explicit FileSink(const std::string& path) : path_(path), out_(path, std::ios::binary | std::ios::trunc) {
        if (!out_)
            throw std::runtime_error("nitfsample: cannot create " + path);
    }
    void put(const char* data, std::size_t size) override {
        out_.write(data, static_cast<std::streamsize>(size));
        if (!out_)
            throw std::runtime_error("nitfsample: cannot write " + path_);
    }
    void close() {
        out_.close();
        if (!out_)
            throw std::runtime_error("nitfsample: cannot write " + path_);
    }

private:
    std::string path_;
    std::ofstream out_;
};

std::string padded(const std::string& text, std::size_t width) {
    std::string out = text.substr(0, width);
    out.resize(width, ' ');
    return out;
}

} // namespace

std::string treBytes(const std::vector<Tre>& tres) {
    std::string out;
    for (const Tre& tre : tres) {
        if (tre.data.size() > 99999)
            throw std::invalid_argument("nitfsample: TRE " + tre.tag + " is longer than 99999 bytes");
        out += padded(tre.tag, 6) + digits(tre.data.size(), 5) + tre.data;
    }
    return out;
}

Des treOverflow(const std::string& area, int item, const std::vector<Tre>& tres, const std::string& version) {
    Des des;
    if (detail::familyOf(version) == Family::V20)
        des.desid = area == "UDHD" || area == "UDID" ? "Registered Extensions" : "Controlled Extensions";
    else
        des.desid = "TRE_OVERFLOW";
    des.desoflw = area;
    des.desitem = item;
    des.data = treBytes(tres);
    return des;
}

Des streamingFileHeader(const std::string& replacementHeaderBytes) {
    Des des;
    des.desid = "STREAMING_FILE_HEADER";
    const std::string length = digits(replacementHeaderBytes.size(), 7);
    des.data = length + std::string("\x0A\x6E\x1D\x97", 4) + replacementHeaderBytes +
               std::string("\x0E\xCA\x14\xBF", 4) + length;
    return des;
}

std::string build(const File& file) {
    Plan plan = makePlan(file);
    std::string out;
    out.reserve(plan.fileLength);
    StringSink sink(out);
    emit(file, plan, sink);
    return out;
}

void write(const File& file, const std::string& path) {
    Plan plan = makePlan(file);
    FileSink sink(path);
    emit(file, plan, sink);
    sink.close();
}

File defaultSample() {
    File file;
    file.ostaid = "NITFSAMPLE";
    file.ftitle = "nitf demo sample: 256 x 256 RGB colour ramps in 128 x 128 blocks";
    file.oname = "nitf sample writer";
    file.udhd.push_back({"JITCID", padded("Demo file made by the nitf sample writer; uncompressed RGB, band "
                                          "interleaved by block, geographic corners, one text segment.",
                                          200)});

    Image image;
    image.iid1 = "DEMO";
    image.iid2 = "Colour ramps";
    image.isorce = "Synthetic pattern";
    image.rows = 256;
    image.cols = 256;
    image.bands = 3;
    image.irep = "RGB";
    image.imode = 'B';
    image.nppbh = 128;
    image.nppbv = 128;
    image.icords = 'G';
    image.igeolo = "351200N1173000W351200N1172900W351100N1172900W351100N1173000W";
    image.comments.push_back("Red grows to the right, green downwards, blue towards the centre.");
    image.sample = [](int band, int row, int col) -> uint64_t {
        if (band == 0)
            return static_cast<uint64_t>(col);
        if (band == 1)
            return static_cast<uint64_t>(row);
        return static_cast<uint64_t>(std::max(0, 255 - std::abs(col - 128) - std::abs(row - 128)));
    };
    file.images.push_back(image);

    Text text;
    text.textid = "README";
    text.txtitl = "About this file";
    text.data = "This NITF 2.1 file was made by the nitf sample writer.\r\n"
                "Image DEMO: 256 x 256 pixels, 3 bands of 8 bits, 4 blocks.\r\n";
    file.texts.push_back(text);
    return file;
}

} // namespace nitfsample
