// The default host library: file layer, memory and strings, errors and debug, configuration, projection.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "HostConfig.h"
#include "HostError.h"
#include "HostFile.h"
#include "TestFiles.h"
#include "HostMemory.h"
#include "HostProjection.h"

namespace {

struct Freer {
    void operator()(void* block) const { std::free(block); }
};
using HostText = std::unique_ptr<char, Freer>;

} // namespace

TEST(HostFile, ModesFromFlagsAndStreamNames) {
    TempDir dir;
    std::string path = dir.file("modes.bin"), missing = dir.file("missing.bin");
    char text[8] = {};
    EXPECT_EQ(DKOpen(missing.c_str(), DK_MODE_READ_BINARY, nullptr), nullptr);
    EXPECT_EQ(DKOpen(missing.c_str(), DK_WRITE | DK_BINARY | DK_EXISTING, ""), nullptr);

    // The creator's mode makes a file that can be read back through the same stream.
    FILE* fp = DKOpen(path.c_str(), DK_MODE_CREATE_BINARY, nullptr);
    ASSERT_NE(fp, nullptr);
    EXPECT_STREQ(fp2filename(fp), path.c_str());
    ASSERT_EQ(DKFWrite("hello", 1, 5, fp), 5u);
    ASSERT_EQ(DKFSeek(fp, 0, SEEK_SET), 0);
    EXPECT_EQ(DKFRead(text, 1, 5, fp), 5u);
    DKClose(fp);
    // Writing without creating keeps the existing contents; the reader's mode is read-only.
    fp = DKOpen(path.c_str(), DK_WRITE | DK_BINARY, "");
    DKFWrite("J", 1, 1, fp);
    DKClose(fp);
    fp = DKOpen(path.c_str(), DK_MODE_READ_BINARY, nullptr);
    EXPECT_EQ(DKFRead(text, 1, 5, fp), 5u);
    EXPECT_STREQ(text, "Jello");
    EXPECT_EQ(DKFWrite("x", 1, 1, fp), 0u);
    DKClose(fp);
}

TEST(HostMemory, ScanInt64) {
    struct Case {
        const char* text;
        int length;
        __int64 expected;
    };
    const Case cases[] = {{"  12ab", -1, 12},
                          {"ABC", -1, 0},
                          {"", -1, 0},
                          {" \t-42", -1, -42},
                          {"+7", -1, 7},
                          {"- 5", -1, 0},
                          {"12345", 3, 123},
                          {"   9", 3, 0},
                          {"00000000000000000000000000000042", -1, 42},
                          {"9223372036854775807", -1, INT64_MAX},
                          {"9223372036854775808", -1, INT64_MAX},
                          {"-9223372036854775808", -1, INT64_MIN},
                          {"-9223372036854775809", -1, INT64_MIN},
                          {"999999999999999999999999999999", -1, INT64_MAX},
                          {"-999999999999999999999999999999", -1, INT64_MIN}};
    for (const Case& c : cases)
        EXPECT_EQ(ScanInt64(c.text, c.length), c.expected) << '"' << c.text << "\" length " << c.length;

    // Neither past `length` (a heap block without terminator: the sanitizer catches an over-read) nor past
    // NUL.
    std::unique_ptr<char[]> digits(new char[4]);
    std::memcpy(digits.get(), "1234", 4);
    EXPECT_EQ(ScanInt64(digits.get(), 4), 1234);
    const char stopped[] = {'4', '2', '\0', '7', '7'};
    EXPECT_EQ(ScanInt64(stopped, 5), 42);

    char buffer[21];
    EXPECT_STREQ(PrintInt64(buffer, INT64_MIN), "-9223372036854775808");
    EXPECT_EQ(ScanInt64(PrintInt64(buffer, INT64_MAX), -1), INT64_MAX);
}

TEST(HostMemory, FormattingAndAllocation) {
    const std::string big(5000, 'z');
    EXPECT_EQ(std::string(HostText(MkName("<%s>-%03d", big.c_str(), 7)).get()), "<" + big + ">-007");
    EXPECT_EQ(HString(nullptr), nullptr);
    EXPECT_NE(HostText(static_cast<char*>(HMalloc(0))), nullptr);

    char leading[] = " \t ab ";
    EXPECT_STREQ(LSCEatWS(leading), "ab ");

#if !defined(__SANITIZE_ADDRESS__) // the sanitizer's allocator aborts instead of failing the request
    EXPECT_THROW(HMalloc(SIZE_MAX), vexo::Exception);
    EXPECT_THROW(HCalloc(SIZE_MAX, 2), vexo::Exception);
#endif
}

TEST(HostError, ExceptionsWarningsAndDebugTraces) {
    EXPECT_EQ(refusalOf([] { IMPError("Invalid image index", "int f(int)", "nitf/Reader", 42); }),
              "Invalid image index");

    // Without a handler of the caller's, warnings and traces go to stderr; traces above the level only.
    using vexo::nspio::Debugger;
    using vexo::nspio::Warning;
    Warning::Handler previous = Warning::setHandler(nullptr);
    testing::internal::CaptureStderr();
    Warning::Warn("plain", "w", 3);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "warning: plain (w:3)\n");
    Warning::setHandler(previous);

    const int savedLevel = Debugger::getLevel();
    testing::internal::CaptureStderr();
    Debugger::setLevel(0);
    Debugger::Debug("segrix", "hidden", "d", 1);
    Debugger::setLevel(2);
    EXPECT_TRUE(DebugOver(1));
    EXPECT_FALSE(DebugOver(2));
    Debugger::Debug("segrix", "trace", "d", 5);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "[segrix] trace (d:5)\n");
    Debugger::setLevel(savedLevel);
}

TEST(HostConfig, MetadataLists) {
    // The metadata lists TREs export: a later entry of a key, whatever its case, replaces the earlier one.
    char** list = nullptr;
    for (int i = 0; i < 100; ++i)
        list = SetAuxEntry(list, ("K" + std::to_string(i)).c_str(), std::to_string(i * i).c_str());
    list = SetAuxEntry(list, "k57", "replaced");
    EXPECT_EQ(CountStringList(list), 100);
    EXPECT_STREQ(FetchAuxEntry(list, "K57"), "replaced");
    EXPECT_STREQ(FetchAuxEntry(list, "K99"), "9801");
    EXPECT_EQ(FetchAuxEntry(list, "K"), nullptr) << "a key prefix is not the key";
    DestroyStringList(list);
}

TEST(HostConfig, KeyValueFilesFoundUnderNitfHome) {
    TempDir home;
    home.write("config/sites.txt",
               "# comment\n\n  CITY = Oslo \nTIME: 12:00\nno separator\n=no key\ncity=Bergen");
    const char* saved = std::getenv("NITF_HOME");
    const std::string savedHome = saved ? saved : "";
    setenv("NITF_HOME", home.path().c_str(), 1);
    HostText found(IMPFindFile("config", "sites.txt"));
    HostText missing(IMPFindFile("config", "absent.txt"));
    saved ? setenv("NITF_HOME", savedHome.c_str(), 1) : unsetenv("NITF_HOME");
    ASSERT_TRUE(found);
    EXPECT_EQ(std::string(found.get()), home.file("config/sites.txt"));
    EXPECT_FALSE(missing);

    // Keys and values trimmed, the first separator ends the key, a later line of a key replaces it.
    char** list = TextFileToStringList(found.get());
    EXPECT_EQ(CountStringList(list), 2);
    EXPECT_STREQ(FetchAuxEntry(list, "CITY"), "Bergen");
    EXPECT_STREQ(FetchAuxEntry(list, "TIME"), "12:00");
    DestroyStringList(list);
    EXPECT_EQ(TextFileToStringList(home.file("none").c_str()), nullptr);
}

TEST(HostFile, SizeOfAReadStreamDoesNotGrowBySeeking) {
    TempFile file(std::string(100, 'x'));
    FILE* fp = DKOpen(file.path().c_str(), DK_MODE_READ_BINARY, nullptr);
    ASSERT_TRUE(fp);
    ASSERT_EQ(DKFSeek64(fp, 1000000, SEEK_SET), 0);
    EXPECT_EQ(DKSize(fp), 100) << "a length that seeks past the end does not make the file longer";
    DKClose(fp);

    FILE* out = DKOpen(file.path().c_str(), DK_MODE_CREATE_BINARY, nullptr);
    ASSERT_TRUE(out);
    DKFWrite("abc", 1, 3, out);
    EXPECT_EQ(DKSize(out), 3) << "bytes written and not yet flushed count";
    DKClose(out);
}

// (Degrees, minutes and seconds, and MGRS references in the zones IGEOLO takes them, are read and written
// with the georeferencing's corner forms.)
TEST(HostProjection, CornersGiveAnAffineOnlyForParallelogramsAndPositionsEitherWay) {
    ProjInfo_t info;
    InitProjInfo(&info);
    // A rotated and sheared image of 101 x 51 pixels: corners are the centres of the corner pixels.
    const double x[4] = {100, 300, 320, 120}, y[4] = {500, 550, 450, 400};
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&info, x, y, 101, 51), 0);
    const double* a = info.affine;
    const double col[4] = {0, 100, 100, 0}, row[4] = {0, 0, 50, 50};
    for (int i = 0; i < 4; ++i) {
        EXPECT_NEAR(a[0] + a[1] * col[i] + a[2] * row[i], x[i], 1e-9) << "corner " << i;
        EXPECT_NEAR(a[3] + a[4] * col[i] + a[5] * row[i], y[i], 1e-9) << "corner " << i;
    }
    const double broken[4] = {0, NAN, 0, 0};
    EXPECT_EQ(ProjSetGeoreferenceFromCorners(&info, broken, y, 10, 10), -1);
    EXPECT_EQ(ProjSetGeoreferenceFromCorners(&info, x, y, 0, 10), -1);

    // 11 x 11 pixels of 10 units: a last corner 4 units (0.4 pixel) off still fits the transform, 6 do not.
    const double near[4] = {0, 100, 104, 0}, far[4] = {0, 100, 106, 0}, square[4] = {100, 100, 0, 0};
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&info, near, square, 11, 11), 0);
    EXPECT_EQ(info.hasAffine, 1);
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&info, far, square, 11, 11), 0);
    EXPECT_EQ(info.hasAffine, 0);
    // Positions then come from the corners, bilinearly: exact at the corners, extrapolated beyond them.
    double px, py;
    ASSERT_EQ(ProjPixelToMap(&info, 10, 10, &px, &py), 0);
    EXPECT_EQ(px * 1000 + py, 106000);
    ASSERT_EQ(ProjPixelToMap(&info, 5, 5, &px, &py), 0);
    EXPECT_DOUBLE_EQ(px, 51.5);
    EXPECT_DOUBLE_EQ(py, 50);
    ASSERT_EQ(ProjPixelToMap(&info, 20, 0, &px, &py), 0);
    EXPECT_DOUBLE_EQ(px, 200);

    // Geographic corners across the antimeridian (174E to 169W): between them, positions step east.
    ProjInfo_t geographic;
    InitProjInfo(&geographic);
    geographic.system = PROJ_GEOGRAPHIC;
    const double lon[4] = {174, -169, -169, 174}, lat[4] = {10, 10, 0, 0};
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&geographic, lon, lat, 101, 101), 0);
    ASSERT_EQ(ProjPixelToMap(&geographic, 50, 50, &px, &py), 0);
    EXPECT_DOUBLE_EQ(px, 182.5);
    EXPECT_DOUBLE_EQ(py, 5);

    // A record given only a transform uses it.
    ProjInfo_t affine;
    InitProjInfo(&affine);
    EXPECT_EQ(ProjPixelToMap(&affine, 0, 0, &px, &py), -1);
    affine.hasAffine = 1;
    const double transform[6] = {1, 2, 3, 4, 5, 6};
    std::copy(transform, transform + 6, affine.affine);
    ASSERT_EQ(ProjPixelToMap(&affine, 10, 100, &px, &py), 0);
    EXPECT_EQ(px * 1000 + py, (1 + 20 + 300) * 1000 + 4 + 50 + 600);
}

TEST(HostProjection, UtmHemispheresGeocentricLatitudeAndGeosysTexts) {
    ProjInfo_t utm;
    InitProjInfo(&utm);
    ASSERT_EQ(DecodeGeosys(&utm, "UTM 17N"), 0);
    char text[16];
    ASSERT_EQ(EncodeGeosys(&utm, text, sizeof text), 0);
    EXPECT_STREQ(text, "UTM 17N");
    // A point south of the equator in a northern record has a negative northing, and comes back.
    double latitude, longitude, x, y;
    ASSERT_EQ(GeocodedToProj(&utm, -0.5, -81, &x, &y), 0);
    EXPECT_LT(y, 0);
    ASSERT_EQ(ProjToGeocoded(&utm, x, y, &latitude, &longitude), 0);
    EXPECT_NEAR(latitude, -0.5, 1e-9);
    // Geocentric latitude: the equator and the poles stay, 45 degrees moves by about 11.5'.
    ProjInfo_t geocentric;
    InitProjInfo(&geocentric);
    ASSERT_EQ(DecodeGeosys(&geocentric, "GEOCENTRIC"), 0);
    for (double pole : {-90.0, 0.0, 90.0}) {
        ASSERT_EQ(ProjToGeocoded(&geocentric, 0, pole, &latitude, &longitude), 0);
        EXPECT_EQ(latitude, pole);
    }
    ASSERT_EQ(ProjToGeocoded(&geocentric, 0, 45, &latitude, &longitude), 0);
    EXPECT_NEAR((latitude - 45) * 60, 11.5, 0.1);

    utm.earthModel = EARTH_UNKNOWN;
    EXPECT_EQ(ProjToGeocoded(&utm, 233085, 3807070, &latitude, &longitude), -1);
    ProjInfo_t none;
    InitProjInfo(&none);
    EXPECT_EQ(ProjToGeocoded(&none, 0, 0, &latitude, &longitude), -1);
    EXPECT_EQ(EncodeGeosys(&none, text, sizeof text), -1);
}
