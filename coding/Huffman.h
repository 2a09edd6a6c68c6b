#pragma once

#include <cstdint>

#include "frame/Errors.h"
#include "frame/VarnothExport.h"

// A node of the code tree and the element of the builder's heap. A node is a leaf when
// both children are null.
struct VARNOTH_API CHistCell {
    int32_t m_nSymbol = 0;         // symbol index of a leaf; 0 for an inner node
    int32_t m_nCount = 0;          // frequency, or the sum of the two children's weights
    CHistCell* m_pLeft = nullptr;  // reached by bit 0
    CHistCell* m_pRight = nullptr; // reached by bit 1
};

// One entry of the code table.
struct SHuffmanCode {
    int32_t symbol;  // the symbol's own index, or -1 when the symbol does not occur
    // The code word behind a leading marker bit 1: its length is the position of the highest
    // set bit and it is read from the bit below that down to bit 0 (1 is the empty word,
    // 6 the word 10). 0 for a symbol that does not occur.
    uint32_t code;
};
static_assert(sizeof(SHuffmanCode) == 8, "a code entry is two 32-bit fields");

// Builds a table of Huffman codes, one entry per symbol, from a histogram of frequencies.
class VARNOTH_API CHuffman {
public:
    CHuffman() = default;
    virtual ~CHuffman();
    CHuffman(const CHuffman&) = delete;
    CHuffman& operator=(const CHuffman&) = delete;

    // Replaces the table with one entry per histogram bin; frequencies below 1 mark absent
    // symbols. False (with a trace line) when the histogram is unusable, memory runs out, or
    // the code tree cannot be represented (deeper than 31 levels, or a weight above the
    // 32-bit range); the table may then be partly filled.
    bool CodeBuild(const int* histogram, int symbolCount);

    // Coding of symbol streams is not provided: always true, and writes nothing.
    bool CodeSymbols(const int* symbols, unsigned int symbolCount, unsigned short* output,
                     unsigned int outputCapacity);

    // The table of the last CodeBuild (null before the first) and its number of entries.
    const SHuffmanCode* GetCodes() const { return m_pCodes; }
    int GetSymbolCount() const { return m_nSymbols; }

private:
    void TableBuild(CHistCell* node, unsigned int code);

    SHuffmanCode* m_pCodes = nullptr;
    int32_t m_nSymbols = 0;
};
