// SHA-256 in lower-case hexadecimal, for comparing decoded pixels with the corpus manifest's hashes.
#pragma once

#include <string>

namespace Sha256 {
std::string of(const std::string& bytes);
}
