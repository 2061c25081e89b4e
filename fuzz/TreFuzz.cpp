// Feeds arbitrary bytes to the TRE parsers: the first byte chooses the identifier, the rest is the TRE's
// data.
#include <cstdint>
#include <cstdio>
#include <memory>
#include <vector>

#include "HostConfig.h"
#include "HostError.h"
#include "NitfExtension.h"
#include "NitfTag.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 2)
        return 0;
    // Every TRE the library builds, as its one list registers them.
    static const std::vector<const char*> identifiers = CNitfExtension::getBuiltExtensionNames();
    const size_t count = identifiers.size();
    // A stream in memory: the host cannot size it, so the parsers must ask the stream itself.
    FILE* fp = fmemopen(const_cast<uint8_t*>(data + 1), size - 1, "rb");
    if (!fp)
        return 0;

    CNitfTag tag;
    tag.setIdentifier(identifiers[data[0] % count]);
    tag.setDataOffset(0);
    // The declared length varies with the first byte too: the data's size, or less than it.
    long long length = static_cast<long long>(size - 1);
    tag.setDataLength(data[0] / count % 2 ? length / 2 : length);
    char** metadata = nullptr;
    try {
        std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(&tag));
        if (extension) {
            extension->readNewInfo(fp, false);
            // Exporting the 4096-entry IOMAPA table costs the host list more than it tells about the parsers.
            if (extension->getProperties().size() < 1000)
                extension->asMetadata(metadata, "FUZZ", "_1");
        }
    } catch (const vexo::Exception&) {
    }
    DestroyStringList(metadata);
    std::fclose(fp);
    return 0;
}
