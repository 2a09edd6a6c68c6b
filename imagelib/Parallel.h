#pragma once

#include <functional>

#include "imagelib/ImageLibExport.h"

// The parallel runtime: a blocking parallel-for over index ranges and a task group, both on
// oneTBB. Bodies receive contiguous half-open ranges [begin, end).
namespace imagelib {

using RangeBody = std::function<void(int begin, int end)>;

// Runs body over [begin, end) split into ranges of at least `grain` indexes; returns when
// every range is done.
CIMAGE_API void ParallelFor(int begin, int end, const RangeBody& body, int grain = 1);

// Caps the worker threads of every later parallel call (0 = the machine's cores).
CIMAGE_API void SetThreadLimit(int threads);
CIMAGE_API int GetThreadLimit();

// Runs tasks in parallel; Wait returns when all have finished.
class CIMAGE_API TaskGroup {
public:
    TaskGroup();
    ~TaskGroup();
    TaskGroup(const TaskGroup&) = delete;
    TaskGroup& operator=(const TaskGroup&) = delete;
    void Run(std::function<void()> task);
    void Wait();

private:
    struct Impl;
    Impl* m_impl;
};

}  // namespace imagelib
