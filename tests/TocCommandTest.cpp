// `nitf toc`: the rectangles and frames of raw and NITF-wrapped A.TOC files, with the frame files found
// beside them whatever the case of their names on disk; the RPF description of corpus frames; and the
// refusals.
#include <gtest/gtest.h>

#include <string>

#include "Manifest.h"
#include "RpfTables.h"
#include "TestFiles.h"

namespace {

using nlohmann::json;

// The tool's output; `status` receives its exit status.
std::string toc(const std::string& arguments, int& status) {
    std::string output;
    status = runTool("toc " + arguments, &output);
    return output;
}

// A scratch directory holding an A.TOC and some of its frames.
struct TocDirectory : TempDir {
    explicit TocDirectory(const std::string& tocBytes) {
        write("A.TOC", tocBytes);
        // Names on disk in lower case; the table stores them in upper case.
        write("rpf/onc/001zc013.on1", "frame");
        write("001ALL26.I12", "frame");
    }
};

void expectKnownRectangles(const json& report, const TocDirectory& directory) {
    ASSERT_EQ(report.at("rectangles").size(), 2u);
    const json& first = report["rectangles"][0];
    EXPECT_EQ(first.at("scale"), "1:1,000,000");
    EXPECT_EQ(first.at("horizontalFrames"), 2);
    EXPECT_DOUBLE_EQ(first.at("corners").at("upperRight").at(1).get<double>(), -95.0);
    const json& frames = first.at("frames");
    ASSERT_EQ(frames.size(), 5u);
    EXPECT_EQ(frames[0].at("path"), "./RPF/ONC/001ZC013.ON1");
    EXPECT_EQ(frames[0].at("row"), 2);
    EXPECT_EQ(frames[0].at("column"), 0);
    EXPECT_TRUE(frames[0].at("exists").get<bool>());
    EXPECT_EQ(frames[0].at("file"), directory.file("rpf/onc/001zc013.on1"));
    EXPECT_FALSE(frames[1].at("exists").get<bool>());
    EXPECT_TRUE(frames[1].at("file").is_null());
    const json& second = report["rectangles"][1];
    EXPECT_EQ(second.at("frames").at(0).at("path"), "./001ALL26.I12");
    EXPECT_TRUE(second.at("frames").at(0).at("exists").get<bool>());
    EXPECT_EQ(report.at("framesListed"), 6);
    EXPECT_EQ(report.at("framesPresent"), 2);
}

} // namespace

TEST(TocCommand, RawAndNitfWrappedTablesListTheirFrames) {
    const RpfTestRectangles rectangles = knownRpfRectangles();
    for (const std::string& bytes : {rawRpfToc(rectangles), nitfWrappedRpfToc(rectangles)}) {
        const bool raw = bytes.compare(0, 4, "NITF") != 0;
        SCOPED_TRACE(raw ? "raw" : "NITF-wrapped");
        TocDirectory directory(bytes);
        int status = 0;
        const json report = json::parse(toc("--json '" + directory.file("A.TOC") + "'", status));
        EXPECT_EQ(status, 0);
        EXPECT_EQ(report.at("form"), raw ? "raw" : "NITF-wrapped");
        EXPECT_EQ(report.at("header").at("fileName"), "A.TOC");
        expectKnownRectangles(report, directory);

        const std::string text = toc("'" + directory.file("A.TOC") + "'", status);
        EXPECT_EQ(status, 0);
        EXPECT_NE(text.find("rectangle 0: CADRG 55:1 scale 1:1,000,000, zone 1"), std::string::npos) << text;
        EXPECT_NE(text.find("./RPF/TPC/001ZE013.ON1  (missing)"), std::string::npos) << text;
        EXPECT_NE(text.find("2 boundary rectangles, 6 frames, 2 of them present"), std::string::npos) << text;
    }
}

TEST(TocCommand, FrameFilesAreDescribed) {
    SKIP_WITHOUT_CORPUS();
    int status = 0;
    const json report = json::parse(toc("--json '" + corpusRoot() + "/rpf/001zc013.on1'", status));
    EXPECT_EQ(status, 0);
    const json& frame = report.at("frame");
    EXPECT_EQ(frame.at("header").at("fileName"), "001ZC013.ON1");
    EXPECT_EQ(frame.at("locationCode"), "FHFP79");
    EXPECT_EQ(frame.at("colours").size(), 216u);
    EXPECT_EQ(frame.at("transparentCode"), 216);
    EXPECT_NEAR(frame.at("coverage").at("corners").at("upperLeft").at(0).get<double>(), 31.034482759, 1e-9);
}

TEST(TocCommand, OtherFilesAreRefused) {
    int status = 0;
    TempFile plain("not an RPF file at all", ".bin");
    toc("'" + plain.path() + "'", status);
    EXPECT_NE(status, 0);
    toc("/nonexistent/A.TOC", status);
    EXPECT_NE(status, 0);
    toc("", status);
    EXPECT_EQ(status, 2);
    // A damaged table: a count beyond the file.
    std::string bytes = rawRpfToc(knownRpfRectangles());
    bytes[102 + 4] = '\x7F';
    TempFile damaged(bytes, ".TOC");
    toc("'" + damaged.path() + "'", status);
    EXPECT_EQ(status, 1);
}
