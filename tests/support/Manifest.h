// The conformance corpus's MANIFEST.json, for tests that walk every file.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

struct CorpusFile {
    std::string relative; // path inside the corpus, e.g. "nitf21/i_3001a.ntf"
    std::string path;     // full path
    const nlohmann::json* entry;
};

class Manifest {
public:
    // Loads the manifest of the corpus at corpusRoot(); empty when there is no corpus.
    static const Manifest& get();

    bool empty() const { return m_files.empty(); }
    const std::vector<CorpusFile>& files() const { return m_files; }
    // The files whose entries are not marked malformed.
    std::vector<CorpusFile> wellFormed() const;

private:
    nlohmann::json m_document;
    std::vector<CorpusFile> m_files;
};

class CNitfFileReader;

// Opens a corpus file with `reader`; false when the reader does not take it (not a NITF file, or one it
// refuses).
bool openCorpusFile(CNitfFileReader& reader, const CorpusFile& file);

// In a test: skips it when there is no corpus.
#define SKIP_WITHOUT_CORPUS()                                                                                \
    if (Manifest::get().empty())                                                                             \
    GTEST_SKIP() << "no test corpus"
