// Writes a few fields of each kind to a scratch file through the library and reads them back.
#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>

#include "Commands.h"
#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "HostFile.h"
#include "NitfProperty.h"

namespace {

struct Check {
    int failures = 0;
    void expect(bool ok, const char* what) {
        std::printf("  %-44s %s\n", what, ok ? "ok" : "FAILED");
        if (!ok)
            ++failures;
    }
};

} // namespace

int runSelfCheck(int argc, char** argv) {
    std::string dir = argc > 0 ? argv[0] : (std::getenv("TMPDIR") ? std::getenv("TMPDIR") : "/tmp");
    std::string path = dir + "/nitf-selfcheck-" + std::to_string(getpid()) + ".bin";
    FILE* fp = DKOpen(path.c_str(), DK_MODE_CREATE_BINARY, nullptr);
    if (!fp) {
        std::fprintf(stderr, "nitf: cannot create %s\n", path.c_str());
        return 1;
    }

    CNitfProperty title("SELF CHECK");
    CNitfProperty count(42);
    title.writeString(fp, 12);
    count.writeString(fp, 6);
    CDataStreamWrite out(fp);
    out.writeUint16(0xABCD);
    out.writeInt32(-123456);
    out.writeDecimal64(12000000000LL, 12, true);

    DKFSeek64(fp, 0, SEEK_SET);
    Check check;
    std::printf("nitf self-check in %s\n", path.c_str());
    CNitfProperty* text = CNitfProperty::getNewFromString(fp, 12);
    check.expect(text->toText() == "SELF CHECK  ", "text field, left-justified and blank-filled");
    CDataStreamRead in(fp);
    check.expect(in.readDecimal(6) == 42, "decimal field, zero-filled");
    CNitfProperty* binary = CNitfProperty::getNewFromUint2(fp);
    check.expect(binary->getAsInt() == 0xABCD, "16-bit binary field, big-endian");
    check.expect(in.readInt32() == -123456, "32-bit binary field, big-endian");
    check.expect(in.readDecimal64(12) == 12000000000LL, "64-bit decimal field");
    delete text;
    delete binary;

    DKClose(fp);
    std::remove(path.c_str());
    std::printf("%s\n", check.failures == 0 ? "self-check passed" : "self-check FAILED");
    return check.failures == 0 ? 0 : 1;
}
