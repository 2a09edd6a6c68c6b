#include "coding/Huffman.h"

#include <memory>
#include <new>
#include <vector>

#include "imagelib/Trace.h"

namespace {

// Binary min-heap of cells ordered by count, kept in an array with the smallest at index 0.
// Its push and pop moves are fixed exactly, because they decide which of two equal counts
// comes out first and so which codes the symbols get.
class CellHeap {
public:
    bool Empty() const { return m_cells.empty(); }

    void Push(const CHistCell& cell) {
        m_cells.emplace_back();
        SiftUp(m_cells.size() - 1, cell);
    }

    CHistCell Pop() {
        const CHistCell top = m_cells[0];
        const CHistCell last = m_cells.back();
        const size_t m = m_cells.size() - 1;  // size after the removal
        size_t hole = 0;
        // Walk the hole down along the smaller child; on equal counts the right child moves up.
        while (2 * hole + 2 < m) {
            size_t child = 2 * hole + 2;
            if (m_cells[child].m_nCount > m_cells[child - 1].m_nCount) --child;
            m_cells[hole] = m_cells[child];
            hole = child;
        }
        if (2 * hole + 2 == m) {
            m_cells[hole] = m_cells[m - 1];
            hole = m - 1;
        }
        SiftUp(hole, last);
        m_cells.pop_back();
        return top;
    }

private:
    // Parents move down only when strictly heavier, so equal counts keep their places.
    void SiftUp(size_t hole, const CHistCell& cell) {
        while (hole > 0) {
            const size_t parent = (hole - 1) / 2;
            if (!(m_cells[parent].m_nCount > cell.m_nCount)) break;
            m_cells[hole] = m_cells[parent];
            hole = parent;
        }
        m_cells[hole] = cell;
    }

    std::vector<CHistCell> m_cells;
};

}  // namespace

CHuffman::~CHuffman() { delete[] m_pCodes; }

bool CHuffman::CodeBuild(const int* histogram, int symbolCount) {
    if (symbolCount < 0 || (symbolCount > 0 && histogram == nullptr)) {
        Trace(L"CHuffman::CodeBuild: no histogram of %d symbols\n", symbolCount);
        return false;
    }
    try {
        delete[] m_pCodes;
        m_pCodes = nullptr;
        m_nSymbols = 0;
        m_pCodes = new SHuffmanCode[static_cast<size_t>(symbolCount)]();
        m_nSymbols = symbolCount;

        CellHeap heap;
        for (int i = 0; i < symbolCount; ++i) {
            if (histogram[i] < 1) {
                m_pCodes[i].symbol = -1;
            } else {
                heap.Push(CHistCell{i, histogram[i], nullptr, nullptr});
                m_pCodes[i].symbol = i;
            }
        }

        // Every popped cell becomes a tree node of its own; the tree is released on return.
        std::vector<std::unique_ptr<CHistCell>> nodes;
        nodes.reserve(2 * static_cast<size_t>(symbolCount));
        CHistCell* root = nullptr;
        while (!heap.Empty()) {
            nodes.push_back(std::make_unique<CHistCell>(heap.Pop()));
            CHistCell* lighter = nodes.back().get();
            if (heap.Empty()) {
                root = lighter;
                break;
            }
            nodes.push_back(std::make_unique<CHistCell>(heap.Pop()));
            CHistCell* heavier = nodes.back().get();
            int32_t weight = 0;
            // A total beyond the 32-bit weight cannot be represented in the tree.
            if (__builtin_add_overflow(lighter->m_nCount, heavier->m_nCount, &weight)) throw OutOfRangeT();
            heap.Push(CHistCell{0, weight, lighter, heavier});
        }
        if (root != nullptr) TableBuild(root, 1);
    } catch (const OutOfRangeT&) {
        Trace(L"CHuffman: error in building the codes table\n");
        return false;
    } catch (const std::bad_alloc&) {
        Trace(L"CHuffman::CodeBuild: allocation failure\n");
        return false;
    }
    return true;
}

bool CHuffman::CodeSymbols(const int*, unsigned int, unsigned short*, unsigned int) { return true; }

void CHuffman::TableBuild(CHistCell* node, unsigned int code) {
    if (node == nullptr) return;
    constexpr unsigned int kTopBit = 0x80000000u;
    while (node->m_pLeft != nullptr || node->m_pRight != nullptr) {
        // One more level would push the marker bit out of the 32-bit code field.
        if (code & kTopBit) throw OutOfRangeT();
        if (node->m_pLeft != nullptr) TableBuild(node->m_pLeft, 2 * code);
        node = node->m_pRight;
        code = 2 * code + 1;
        if (node == nullptr) return;
    }
    const int32_t symbol = node->m_nSymbol;
    if (symbol < 0 || symbol >= m_nSymbols || m_pCodes[symbol].symbol == -1) throw OutOfRangeT();
    m_pCodes[symbol].code = code;
}
