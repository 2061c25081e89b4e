// Files for intermediate bytes, removed from their directory as soon as they are made: they disappear with
// their descriptor whatever happens to the process.
#pragma once

#include <string>

namespace nitfextract {

// A new such file in `directory`, its name starting with `prefix`; its descriptor, or -1 (errno says why).
int openUnlinkedFile(const std::string& directory, const std::string& prefix);

} // namespace nitfextract
