#include "GdalOracle.h"

#include <cstdio>
#include <stdexcept>

#include <sys/wait.h>

std::optional<nlohmann::json> gdalView(const std::vector<std::string>& paths) {
    std::string command = "/usr/bin/python3 " NITF_SOURCE_DIR "/tests/support/gdal_oracle.py";
    for (const std::string& path : paths)
        command += " '" + path + "'";
    command += " 2>/dev/null";
    FILE* pipe = popen(command.c_str(), "r");
    if (!pipe)
        return std::nullopt;
    std::string output;
    char buffer[65536];
    size_t got;
    while ((got = std::fread(buffer, 1, sizeof buffer, pipe)) > 0)
        output.append(buffer, got);
    const int status = pclose(pipe);
    // 3: no GDAL bindings; 127: no interpreter.
    if (!WIFEXITED(status) || WEXITSTATUS(status) == 3 || WEXITSTATUS(status) == 127)
        return std::nullopt;
    if (WEXITSTATUS(status) != 0)
        throw std::runtime_error("GDAL could not read the files (" + command + ")");
    return nlohmann::json::parse(output);
}
