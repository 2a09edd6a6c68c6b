#pragma once

#include <chrono>

#include "imagelib/ImageLibExport.h"

// Wall-clock stopwatch with microsecond readings.
class CIMAGE_API CStopWatch {
public:
    CStopWatch() { Start(); }
    void Start() { m_start = std::chrono::steady_clock::now(); }
    double ElapsedMicro() const {
        return std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - m_start)
            .count();
    }

private:
    std::chrono::steady_clock::time_point m_start;
};
