#include "RPFIMGExtension.h"

#include <algorithm>
#include <vector>

#include "DataStream.h"
#include "HostFile.h"
#include "RpfSections.h"

namespace {

const int kLocationHeaderLength = 14;
const int kLocationRecordLength = 10;
const unsigned kLocationSectionId = 129;

// Bytes from a stream position on, as far as the file has them; values beyond them read as 0.
class Bytes {
public:
    // Reads up to `length` bytes at the stream's position and puts the stream back there.
    Bytes(FILE* fp, __int64 length) {
        __int64 here = DKFTell(fp);
        m_bytes.resize(
            static_cast<size_t>(std::max<__int64>(0, std::min(length, CDataStream::remaining(fp)))));
        m_bytes.resize(DKFRead(m_bytes.data(), 1, m_bytes.size(), fp));
        DKFSeek64(fp, here, SEEK_SET);
    }

    __int64 size() const { return static_cast<__int64>(m_bytes.size()); }

    // The big-endian unsigned number of `width` bytes at `offset`.
    __int64 value(__int64 offset, int width) const {
        __int64 result = 0;
        for (int i = 0; i < width; ++i) {
            __int64 at = offset + i;
            unsigned char byte = at >= 0 && at < static_cast<__int64>(m_bytes.size()) ? m_bytes[at] : 0;
            result = (result << 8) | byte;
        }
        return result;
    }

private:
    std::vector<unsigned char> m_bytes;
};

struct Component {
    unsigned id;
    __int64 length;
    __int64 location; // absolute file offset as recorded
};

std::vector<Component> componentsOf(const Bytes& data) {
    __int64 tableOffset = data.value(2, 4);
    __int64 count = data.value(6, 2);
    std::vector<Component> components;
    // Records past the bytes there are would all read as zeros.
    for (__int64 i = 0; i < count && tableOffset + i * kLocationRecordLength < data.size(); ++i) {
        __int64 at = tableOffset + i * kLocationRecordLength;
        components.push_back(
            {static_cast<unsigned>(data.value(at, 2)), data.value(at + 2, 4), data.value(at + 6, 4)});
    }
    return components;
}

} // namespace

void CRPFIMGExtension::readInfo(FILE* fp) {
    __int64 start = DKFTell(fp);
    Bytes header(fp, kLocationHeaderLength);
    __int64 tableOffset = header.value(2, 4);
    readLayout(fp, rpfsections::LocationHeader());
    __int64 headerLength = m_readLength;
    DKFSeek64(fp, start + tableOffset, SEEK_SET);
    readLayout(fp, rpfsections::LocationRecords(), header.value(6, 2));
    m_readLength = m_readLength > 0 ? std::max(headerLength, tableOffset + m_readLength) : headerLength;
}

void CRPFIMGExtension::readRecords(FILE* fp, __int64 at, const CRecordLayout& records, __int64 count) {
    __int64 headerLength = m_readLength;
    DKFSeek64(fp, at, SEEK_SET);
    readLayout(fp, records, count);
    m_readLength = std::max(headerLength, m_readLength);
}

void CRPFIMGExtension::readRpfSections(FILE* fp, bool) {
    __int64 start = DKFTell(fp);
    Bytes data(fp, m_dataLength);
    readInfo(fp);
    __int64 extent = m_readLength;

    std::vector<Component> components = componentsOf(data);
    // Recorded locations are file offsets of the file the sections were made for. The location section is the
    // start of the TRE: measuring from its own recorded location keeps the sections found in a file that
    // moved them.
    __int64 base = -1;
    for (const Component& component : components) {
        if (component.id == kLocationSectionId) {
            base = component.location;
            break;
        }
    }
    __int64 lookupRecords = 0;
    __int64 colormapRecords = 0;
    for (unsigned id = 130; id <= 138; ++id) {
        auto found = std::find_if(components.begin(), components.end(),
                                  [id](const Component& component) { return component.id == id; });
        if (found == components.end())
            continue;
        __int64 offset = found->location - (base >= 0 ? base : start);
        if (offset < 0 || offset + found->length > m_dataLength)
            continue; // elsewhere in the file
        DKFSeek64(fp, start + offset, SEEK_SET);
        m_readLength = 0;
        switch (id) {
        case 130:
            readLayout(fp, rpfsections::Coverage());
            break;
        case 131:
            readLayout(fp, rpfsections::Compression());
            lookupRecords = data.value(offset + 2, 2);
            break;
        case 132:
            readLayout(fp, rpfsections::LookupHeader());
            readRecords(fp, start + offset + data.value(offset, 4), rpfsections::LookupRecords(),
                        lookupRecords);
            break;
        case 134:
            readLayout(fp, rpfsections::ColorGrayscale());
            colormapRecords = data.value(offset, 1);
            break;
        case 135:
            readLayout(fp, rpfsections::ColormapHeader());
            readRecords(fp, start + offset + data.value(offset, 4), rpfsections::ColormapRecords(),
                        colormapRecords);
            break;
        case 136:
            readLayout(fp, rpfsections::ImageDescription());
            break;
        case 137:
            readLayout(fp, rpfsections::ImageDisplay());
            break;
        case 138:
            readLayout(fp, rpfsections::Mask());
            break;
        default:
            continue; // 133: compression parameters, not described
        }
        if (m_readLength > 0) // the section was there to read
            extent = std::max(extent, offset + found->length);
    }
    m_readLength = extent;
}
