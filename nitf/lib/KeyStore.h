// Property-map keys that a record reader had to build (those of repeated fields, "BANDID_2", "IREPBAND07"):
// kept in a few large blocks instead of one allocation each, for as long as the map that uses them.
#pragma once

#include <cstddef>
#include <memory>
#include <vector>

class CKeyStore {
public:
    CKeyStore() = default;
    CKeyStore(const CKeyStore&) = delete;
    CKeyStore& operator=(const CKeyStore&) = delete;

    // A stable, NUL-terminated copy of the `length` characters at `key`.
    char* add(const char* key, size_t length);
    // Releases every key.
    void clear();

private:
    // The first keys go here: most owners have a handful and need no block at all.
    char m_first[192];
    std::vector<std::unique_ptr<char[]>> m_blocks;
    size_t m_used = 0;
    size_t m_capacity = 0;
};
