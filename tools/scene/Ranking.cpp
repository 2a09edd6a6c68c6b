#include "scene/Ranking.h"

#include <cstdio>

namespace scene {

void PrintRanking(const char* heading, const std::vector<Outcome>& outcomes) {
    std::printf("\n%s\n", heading);
    std::printf("  %-4s %-12s %10s %10s %16s\n", "rank", "method", "time ms", "PSNR dB", "glare left %");
    for (size_t i = 0; i < outcomes.size(); ++i) {
        const Outcome& o = outcomes[i];
        std::printf("  %-4zu %-12s %10.1f %10.2f %16.2f\n", i + 1, o.name.c_str(), o.ms, o.quality.psnr,
                    100.0 * o.quality.glareRemaining);
    }
}

}  // namespace scene
