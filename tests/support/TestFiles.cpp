#include "TestFiles.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "HostFile.h"

static bool isDirectory(const std::string& path) {
    struct stat st;
    return !path.empty() && stat(path.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
}

TempFile::TempFile(const std::string& contents, const std::string& suffix) {
    const char* dir = std::getenv("TMPDIR");
    std::string pattern = std::string(dir && *dir ? dir : "/tmp") + "/nitf-test-XXXXXX" + suffix;
    int fd = mkstemps(&pattern[0], static_cast<int>(suffix.size()));
    if (fd < 0)
        throw std::runtime_error("cannot create a temporary file");
    close(fd);
    m_path = pattern;
    write(contents);
}

TempFile::~TempFile() {
    std::remove(m_path.c_str());
}

void TempFile::write(const std::string& contents) const {
    std::ofstream out(m_path, std::ios::binary | std::ios::trunc);
    out.write(contents.data(), static_cast<std::streamsize>(contents.size()));
    if (!out)
        throw std::runtime_error("cannot write " + m_path);
}

std::string TempFile::read() const {
    return readWholeFile(m_path);
}

TempDir::TempDir() {
    std::string pattern = (std::filesystem::temp_directory_path() / "nitf-test-XXXXXX").string();
    if (!mkdtemp(&pattern[0]))
        throw std::runtime_error("cannot create a temporary directory");
    m_path = pattern;
}

TempDir::~TempDir() {
    std::error_code ignored;
    std::filesystem::remove_all(m_path, ignored);
}

void TempDir::write(const std::string& name, const std::string& contents) const {
    std::filesystem::create_directories(std::filesystem::path(file(name)).parent_path());
    std::ofstream(file(name), std::ios::binary) << contents;
}

ByteStream::ByteStream(const std::string& bytes) : m_file(bytes, ".bin") {
    m_fp = DKOpen(m_file.path().c_str(), DK_READ | DK_WRITE | DK_BINARY | DK_EXISTING, "r+b");
    if (!m_fp)
        throw std::runtime_error("cannot open " + m_file.path());
}

ByteStream::~ByteStream() {
    DKClose(m_fp);
}

std::string ByteStream::contents() const {
    std::fflush(m_fp);
    return m_file.read();
}

std::string corpusRoot() {
    const char* env = std::getenv("NITF_TEST_DATA");
    if (env && *env)
        return isDirectory(env) ? std::string(env) : std::string();
    std::string beside = std::string(NITF_SOURCE_DIR) + "/../shared/testdata";
    return isDirectory(beside) ? beside : std::string();
}

std::string readWholeFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream contents;
    contents << in.rdbuf();
    return contents.str();
}

int runTool(const std::string& arguments, std::string* output) {
    const std::string command = std::string(NITF_TOOL_PATH) + " 2>/dev/null " + arguments;
    FILE* pipe = popen(command.c_str(), "r");
    if (!pipe)
        throw std::runtime_error("cannot run " + command);
    std::string text;
    char buffer[65536];
    for (size_t got; (got = std::fread(buffer, 1, sizeof buffer, pipe)) > 0;)
        text.append(buffer, got);
    const int status = pclose(pipe);
    if (output)
        *output = text;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

bool haveCommand(const std::string& name) {
    return std::system(("command -v " + name + " >/dev/null 2>&1").c_str()) == 0;
}

CapturedWarnings::CapturedWarnings() {
    m_previous = vexo::nspio::Warning::setHandler(
        [this](const char* message, const char*, int) { m_messages.push_back(message); });
}

CapturedWarnings::~CapturedWarnings() {
    vexo::nspio::Warning::setHandler(m_previous);
}

int CapturedWarnings::count(const std::string& part) const {
    int n = 0;
    for (const std::string& message : m_messages)
        n += message.find(part) != std::string::npos;
    return n;
}

std::string joined(std::initializer_list<std::string> fields) {
    std::string out;
    for (const std::string& field : fields)
        out += field;
    return out;
}
