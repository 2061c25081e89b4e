// Opens random bytes as a NITF file and writes back its file header and every image sub-header it can read:
// whatever the fields hold, a writer produces exactly the bytes its measure counts (less the extended area a
// sub-header read from a file still counts) and what it wrote reads back.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "NitfFileHeader.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "TestFiles.h"

namespace {

void check(bool condition) {
    if (!condition)
        std::abort();
}

void writeBack(CNitfFileHeader& header, FILE* in) {
    if (header.getVersion() == eNitfVersion11)
        return;
    ByteStream out("");
    header.write(out.get());
    check(DKFTell(out.get()) == header.computeStorageLength());
    for (int i = 0; i < header.getImageCount(); ++i) {
        std::unique_ptr<CNitfImageSubheader> image(header.getNewImageSubheader(in, i));
        if (!image)
            continue;
        __int64 expected = image->computeStorageLength();
        CNitfProperty* extended = FindProperty(image->getProperties(), "IXSHDL");
        if (extended && extended->getAsInt() > 0)
            expected -= extended->getAsInt();
        DKFSeek64(out.get(), 0, SEEK_SET);
        image->write(out.get());
        check(DKFTell(out.get()) == expected);
        DKFSeek64(out.get(), 0, SEEK_SET);
        std::unique_ptr<CNitfImageSubheader> again(header.getNewImageSubheader(in, i));
        again->read(out.get(), header.getVersion() == eNitfVersion20 ? eNitfVersion20 : eNitfVersion21);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    try {
        CNitfFileReader reader;
        if (reader.openMemory(data, size))
            writeBack(*reader.getFileHeader(), reader.getInputStream());
    } catch (const vexo::Exception&) {
        // Refused: a number that does not fit its field, a damaged structure.
    }
    return 0;
}
