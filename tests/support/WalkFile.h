// Opens a file and reads everything the library can read from it, the way a careful application would: every
// sub-header, every segment's data, every TRE entry. Used by the robustness tests and the fuzz targets.
#pragma once

#include <string>

// Returns normally when the file was read or refused with vexo::Exception (the message goes to `refusal`, when
// given); anything else (a crash, another exception type) is the caller's failure to report.
void walkFile(const std::string& path, std::string* refusal = nullptr);
