// A serializer over a C stream.
#pragma once

#include <cstdio>

#include "Serializer.h"

namespace nitf {

class CSerializerFile : public CSerializer {
public:
    explicit CSerializerFile(FILE* fp) : m_fp(fp) {}
    FILE* getStream() const { return m_fp; }

protected:
    FILE* m_fp;
};

} // namespace nitf
