#include "ScratchFile.h"

#include <cstdlib>

#include <unistd.h>

namespace nitfextract {

int openUnlinkedFile(const std::string& directory, const std::string& prefix) {
    std::string path = directory + "/" + prefix + "XXXXXX";
    const int fd = mkstemp(&path[0]);
    if (fd >= 0)
        unlink(path.c_str());
    return fd;
}

} // namespace nitfextract
