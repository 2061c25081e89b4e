// The umbrella header must name every exported header, so that callers who include it get the whole
// interface.
#include <gtest/gtest.h>

#include <dirent.h>
#include <string>

#include "TestFiles.h"
#include "nitf.h"

TEST(UmbrellaHeader, IncludesEveryExportedHeader) {
    std::string dir = std::string(NITF_SOURCE_DIR) + "/nitf/include";
    std::string umbrella = readWholeFile(dir + "/nitf.h");
    DIR* listing = opendir(dir.c_str());
    ASSERT_NE(listing, nullptr);
    while (dirent* entry = readdir(listing)) {
        std::string name = entry->d_name;
        bool header = name.size() > 2 && name.substr(name.size() - 2) == ".h" && name != "nitf.h";
        if (header) {
            EXPECT_NE(umbrella.find("#include \"" + name + "\""), std::string::npos) << name;
        }
    }
    closedir(listing);
}
