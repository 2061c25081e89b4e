#include "SerializableRecord.h"

#include "HostFile.h"
#include "Raise.h"
#include "SerializerFile.h"

static const char kSourceFile[] = "nitf/lib/rpf/SerializableRecord";

namespace nitf {

void CSerializableRecord::serialize(CSerializer& out) {
    CBinaryFields driver(out, CBinaryFields::eWrite);
    fields(driver);
}

void CSerializableRecord::deserialize(CSerializer& in) {
    // Reads are checked against the end of the file, so that counts and lengths found in it are never
    // followed past it.
    auto* file = dynamic_cast<CSerializerFile*>(&in);
    const __int64 size = file && file->getStream() ? DKSize(file->getStream()) : -1;
    if (size < 0)
        NITF_RAISE_FORMAT("void __cdecl nitf::CSerializableRecord::deserialize(class nitf::CSerializer &)",
                          "The %s can only be read from a file", recordName());
    CBinaryFields driver(in, CBinaryFields::eRead, size);
    driver(*this);
}

} // namespace nitf
