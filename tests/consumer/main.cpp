// Uses the installed library: properties, fields read through the host file layer, and the exception type.
#include <nitf/nitf.h>

#include <cstdio>
#include <cstring>

static int failures = 0;

static void expect(bool ok, const char* what) {
    std::printf("%-60s %s\n", what, ok ? "ok" : "FAILED");
    failures += ok ? 0 : 1;
}

int main(int argc, char** argv) {
    const char* path = argc > 1 ? argv[1] : "consumer-fields.bin";
    FILE* fp = DKOpen(path, DK_MODE_CREATE_BINARY, nullptr);
    if (!fp)
        return 1;
    CNitfProperty title("CONSUMER");
    title.writeString(fp, 10);
    CNitfProperty count(7);
    count.writeString(fp, 3);
    DKFSeek64(fp, 0, SEEK_SET);
    CNitfProperty* text = CNitfProperty::getNewFromString(fp, 10);
    CNitfProperty* number = CNitfProperty::getNewFromString(fp, 3);
    expect(std::strcmp(text->getAsString(), "CONSUMER  ") == 0,
           "text field read back through the host file layer");
    expect(number->getAsInt() == 7, "numeric field read back");
    delete text;
    delete number;
    DKClose(fp);
    std::remove(path);

    CNitfProperty empty;
    try {
        empty.getLength();
        expect(false, "getLength of an empty property raises");
    } catch (const vexo::Exception& e) {
        expect(std::strcmp(e.what(), "Unknown data, can't get length.") == 0, "exception message");
        expect(std::strcmp(e.getSignature(), "unsigned __int64 __cdecl CNitfProperty::getLength(void)") == 0,
               "exception signature text");
        expect(std::strcmp(e.getFile(), "nitf/lib/NitfProperty") == 0, "exception source file");
    }

    CNitfFileReader reader;
    expect(reader.open("/nonexistent/file.ntf") == nullptr, "opening a missing file returns null");
    std::printf("library %s\n", nitfVersion());
    return failures == 0 ? 0 : 1;
}
