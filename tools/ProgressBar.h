// A progress bar on stderr, shown only on a terminal and only once the work has taken more than a moment.
#pragma once

#include <chrono>

class ProgressBar {
public:
    explicit ProgressBar(const char* label = "extracting");
    ~ProgressBar();
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;

    void update(long long done, long long total);

private:
    static constexpr int kWidth = 40;
    const char* m_label;
    bool m_enabled;
    bool m_shown = false;
    int m_percent = -1;
    std::chrono::steady_clock::time_point m_start;
};
