#include "Manifest.h"

#include <fstream>

#include "HostError.h"
#include "NitfFileReader.h"
#include "TestFiles.h"

const Manifest& Manifest::get() {
    static const Manifest manifest = [] {
        Manifest loaded;
        std::string root = corpusRoot();
        if (root.empty())
            return loaded;
        std::ifstream in(root + "/MANIFEST.json");
        if (!in)
            return loaded;
        loaded.m_document = nlohmann::json::parse(in);
        for (auto& item : loaded.m_document["files"].items())
            loaded.m_files.push_back({item.key(), root + "/" + item.key(), &item.value()});
        return loaded;
    }();
    return manifest;
}

std::vector<CorpusFile> Manifest::wellFormed() const {
    std::vector<CorpusFile> files;
    for (const CorpusFile& file : m_files) {
        if (!file.entry->value("malformed", false))
            files.push_back(file);
    }
    return files;
}

bool openCorpusFile(CNitfFileReader& reader, const CorpusFile& file) {
    try {
        return reader.open(file.path.c_str());
    } catch (const vexo::Exception&) {
        return false;
    }
}
