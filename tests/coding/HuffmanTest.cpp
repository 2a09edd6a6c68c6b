#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <queue>
#include <random>
#include <string>
#include <vector>

#include "coding/Huffman.h"
#include "imagelib/Trace.h"

namespace {

struct Entry {
    int symbol;
    unsigned code;
    bool operator==(const Entry&) const = default;
};

std::vector<Entry> Build(const std::vector<int>& histogram, bool expectOk = true) {
    CHuffman huffman;
    EXPECT_EQ(huffman.CodeBuild(histogram.data(), static_cast<int>(histogram.size())), expectOk);
    std::vector<Entry> out;
    for (int i = 0; i < huffman.GetSymbolCount(); ++i)
        out.push_back({huffman.GetCodes()[i].symbol, huffman.GetCodes()[i].code});
    return out;
}

std::vector<std::wstring> g_traces;
void CollectTrace(const wchar_t* line) { g_traces.emplace_back(line); }

// Collects the trace lines written during its lifetime.
struct TraceCapture {
    TraceCapture() { g_traces.clear(), SetTraceHandler(CollectTrace); }
    ~TraceCapture() { SetTraceHandler(nullptr); }
};

int CodeLength(unsigned code) { return 31 - __builtin_clz(code); }

std::string CodeWord(unsigned code) {
    std::string word;
    for (int bit = CodeLength(code) - 1; bit >= 0; --bit) word += ((code >> bit) & 1) ? '1' : '0';
    return word;
}

TEST(Huffman, KnownHistogramsGiveTheirExactCodes) {
    EXPECT_EQ(Build({5, 3}), (std::vector<Entry>{{0, 3}, {1, 2}}));
    EXPECT_EQ(Build({1, 1, 1}), (std::vector<Entry>{{0, 6}, {1, 7}, {2, 2}}));
    EXPECT_EQ(Build({1, 2, 4, 8}), (std::vector<Entry>{{0, 8}, {1, 9}, {2, 5}, {3, 3}}));
    EXPECT_EQ(Build({3, 0, 3, 3, 3}), (std::vector<Entry>{{0, 4}, {-1, 0}, {2, 6}, {3, 5}, {4, 7}}));
    EXPECT_EQ(Build({7}), (std::vector<Entry>{{0, 1}}));
    EXPECT_EQ(Build({0, 0}), (std::vector<Entry>{{-1, 0}, {-1, 0}}));
    EXPECT_EQ(Build({3, -2, 3, INT_MIN}), (std::vector<Entry>{{0, 2}, {-1, 0}, {2, 3}, {-1, 0}}));
    EXPECT_TRUE(Build({}).empty());
}

TEST(Huffman, UnrepresentableTreesAreRefused) {
    TraceCapture capture;
    // Fibonacci frequencies give a tree one level deeper per symbol: 34 symbols need 33 bits.
    std::vector<int> fibonacci = {1, 1};
    while (fibonacci.size() < 34) fibonacci.push_back(fibonacci[fibonacci.size() - 1] + fibonacci[fibonacci.size() - 2]);
    Build(fibonacci, false);
    // 33 symbols need 32 bits, one too many; 32 symbols need 31 and fit.
    fibonacci.resize(33);
    Build(fibonacci, false);
    fibonacci.resize(32);
    int longest = 0;
    for (const Entry& e : Build(fibonacci, true)) longest = std::max(longest, CodeLength(e.code));
    EXPECT_EQ(longest, 31);
    Build({INT_MAX, INT_MAX}, false);  // the root weight overflows 32 bits
    EXPECT_EQ(g_traces, std::vector<std::wstring>(3, L"CHuffman: error in building the codes table\n"));

    CHuffman huffman;
    g_traces.clear();
    EXPECT_FALSE(huffman.CodeBuild(nullptr, 3));
    EXPECT_FALSE(huffman.CodeBuild(fibonacci.data(), -1));
    EXPECT_EQ(huffman.GetCodes(), nullptr);
    EXPECT_EQ(g_traces.size(), 2u);
}

TEST(Huffman, CodeSymbolsWritesNothing) {
    CHuffman huffman;
    unsigned short output[2] = {7, 9};
    const int symbols[2] = {0, 1};
    EXPECT_TRUE(huffman.CodeSymbols(nullptr, 0, nullptr, 0));
    EXPECT_TRUE(huffman.CodeSymbols(symbols, 2, output, 2));
    EXPECT_EQ(output[0], 7);
    EXPECT_EQ(output[1], 9);
}

// Cost of an optimal prefix code: the sum of the weights of all merges.
long long OptimalCost(const std::vector<int>& histogram) {
    std::priority_queue<long long, std::vector<long long>, std::greater<>> queue;
    for (int f : histogram)
        if (f > 0) queue.push(f);
    long long cost = 0;
    while (queue.size() > 1) {
        const long long a = queue.top();
        queue.pop();
        const long long b = queue.top();
        queue.pop();
        cost += a + b;
        queue.push(a + b);
    }
    return cost;
}

TEST(Huffman, RandomHistogramsGetOptimalPrefixFreeCodes) {
    std::mt19937 rng(2024);
    for (int round = 0; round < 200; ++round) {
        const int size = 1 + static_cast<int>(rng() % 300);
        const int spread = round % 3 == 0 ? 4 : 100000;  // few distinct counts: many ties
        std::vector<int> histogram(size);
        for (int& f : histogram) f = rng() % 5 == 0 ? -static_cast<int>(rng() % 3) : static_cast<int>(rng() % spread);

        CHuffman huffman;
        ASSERT_TRUE(huffman.CodeBuild(histogram.data(), size));
        long long cost = 0;
        std::vector<std::string> words;
        for (int i = 0; i < size; ++i) {
            const SHuffmanCode& code = huffman.GetCodes()[i];
            if (histogram[i] < 1) {
                EXPECT_EQ(code.symbol, -1);
                EXPECT_EQ(code.code, 0u);
                continue;
            }
            ASSERT_EQ(code.symbol, i);
            ASSERT_GE(code.code, 1u);
            cost += static_cast<long long>(histogram[i]) * CodeLength(code.code);
            words.push_back(CodeWord(code.code));
        }
        EXPECT_EQ(cost, OptimalCost(histogram)) << "round " << round;
        std::sort(words.begin(), words.end());
        for (size_t i = 1; i < words.size(); ++i)
            EXPECT_NE(words[i].compare(0, words[i - 1].size(), words[i - 1]), 0)
                << words[i - 1] << " is a prefix of " << words[i];
    }
}

}  // namespace
