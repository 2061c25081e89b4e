#include "ProgressBar.h"

#include <cstdio>
#include <string>

#include <unistd.h>

ProgressBar::ProgressBar(const char* label)
    : m_label(label), m_enabled(isatty(STDERR_FILENO) != 0), m_start(std::chrono::steady_clock::now()) {}

ProgressBar::~ProgressBar() {
    if (m_shown)
        std::fprintf(stderr, "\r%*s\r", kWidth + 24, "");
}

void ProgressBar::update(long long done, long long total) {
    if (!m_enabled || total <= 0)
        return;
    const auto elapsed = std::chrono::steady_clock::now() - m_start;
    if (!m_shown && elapsed < std::chrono::milliseconds(500))
        return;
    const int percent = static_cast<int>(100 * done / total);
    if (m_shown && percent == m_percent)
        return;
    m_shown = true;
    m_percent = percent;
    const int filled = static_cast<int>(static_cast<long long>(kWidth) * done / total);
    std::fprintf(stderr, "\r%s [%s%s] %3d%%", m_label, std::string(filled, '#').c_str(),
                 std::string(kWidth - filled, ' ').c_str(), percent);
    std::fflush(stderr);
}
