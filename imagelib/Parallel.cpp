#include "imagelib/Parallel.h"

#include <tbb/blocked_range.h>
#include <tbb/global_control.h>
#include <tbb/parallel_for.h>
#include <tbb/task_arena.h>
#include <tbb/task_group.h>

#include <algorithm>
#include <atomic>
#include <memory>
#include <mutex>

namespace imagelib {

namespace {

std::atomic<int> g_threadLimit{0};
std::mutex g_arenaMutex;
std::shared_ptr<tbb::task_arena> g_arena;

// The arena that honours the current thread limit; rebuilt when the limit changes.
std::shared_ptr<tbb::task_arena> CurrentArena() {
    std::lock_guard<std::mutex> lock(g_arenaMutex);
    const int limit = g_threadLimit.load();
    const int wanted = limit > 0 ? limit : tbb::this_task_arena::max_concurrency();
    if (!g_arena || g_arena->max_concurrency() != wanted) g_arena = std::make_shared<tbb::task_arena>(wanted);
    return g_arena;
}

}  // namespace

void ParallelFor(int begin, int end, const RangeBody& body, int grain) {
    if (end <= begin) return;
    grain = std::max(grain, 1);
    const std::shared_ptr<tbb::task_arena> arena = CurrentArena();
    if (arena->max_concurrency() == 1 || end - begin <= grain) {
        body(begin, end);
        return;
    }
    arena->execute([&] {
        tbb::parallel_for(tbb::blocked_range<int>(begin, end, static_cast<size_t>(grain)),
                          [&](const tbb::blocked_range<int>& r) { body(r.begin(), r.end()); });
    });
}

void SetThreadLimit(int threads) { g_threadLimit.store(std::max(threads, 0)); }

int GetThreadLimit() {
    const int limit = g_threadLimit.load();
    return limit > 0 ? limit : tbb::this_task_arena::max_concurrency();
}

struct TaskGroup::Impl {
    std::shared_ptr<tbb::task_arena> arena = CurrentArena();
    tbb::task_group group;
};

TaskGroup::TaskGroup() : m_impl(new Impl) {}

TaskGroup::~TaskGroup() {
    Wait();
    delete m_impl;
}

void TaskGroup::Run(std::function<void()> task) {
    m_impl->arena->execute([&] { m_impl->group.run(std::move(task)); });
}

void TaskGroup::Wait() {
    m_impl->arena->execute([&] { m_impl->group.wait(); });
}

}  // namespace imagelib
