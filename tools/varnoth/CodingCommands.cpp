// correlate, huffman: correspondence tables between two images and Huffman codes.
#include <algorithm>
#include <cerrno>
#include <climits>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "coding/CorresTable.h"
#include "coding/Huffman.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

namespace {

CPoint ParsePoint(const std::string& text, const std::string& what) {
    const std::vector<double> xy = ParseNumberList(text, 2, what);
    for (double v : xy)
        if (v != std::floor(v) || v < INT_MIN || v > INT_MAX)
            throw ToolError(what + ": '" + text + "' must be two integers x,y");
    return CPoint(static_cast<int>(xy[0]), static_cast<int>(xy[1]));
}

void PrintTableGrid(const CCorresTable& table, CPoint centre, int uLo, int uHi, int vLo, int vHi) {
    std::printf("%6s", "dy\\dx");
    for (int u = uLo; u <= uHi; ++u) std::printf(" %9d", u - centre.x);
    std::printf("\n");
    int index = 0;
    for (int v = vLo; v <= vHi; ++v) {
        std::printf("%6d", v - centre.y);
        for (int u = uLo; u <= uHi; ++u) std::printf(" %9.6f", table.GetTable(index++));
        std::printf("\n");
    }
}

void AddCorrelateCommand(CLI::App& app) {
    struct Args {
        std::string a, b, point, shift = "0,0";
        int radius = 10, window = 7;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand(
        "correlate", "Correlation weights of a window of A against the windows around a search area in B");
    cmd->add_option("A", args->a, "Image holding the point (read as 8-bit grey)")->required();
    cmd->add_option("B", args->b, "Image searched (read as 8-bit grey)")->required();
    cmd->add_option("--point", args->point, "Point x,y in A")->required();
    cmd->add_option("--shift", args->shift, "Predicted displacement dx,dy of the point from A into B (default 0,0)");
    cmd->add_option("--radius", args->radius, "Search radius around point + shift (default 10)")
        ->check(CLI::Range(0, 100));
    cmd->add_option("--window", args->window, "Half-size of the correlation window (default 7)")
        ->check(CLI::Range(0, 1000));
    cmd->callback([args] {
        CImage a = LoadImageAs(args->a, 8);
        CImage b = LoadImageAs(args->b, 8);
        const CPoint p = ParsePoint(args->point, "--point");
        const CPoint q = ParsePoint(args->shift, "--shift");
        const long long cx = static_cast<long long>(p.x) + q.x, cy = static_cast<long long>(p.y) + q.y;

        CCorresTable table(args->radius, args->window);
        table.BuildTable(a, b, p, q);
        if (!table.IsBuilt())
            throw ToolError("the window of half-size " + std::to_string(args->window) + " around point + shift = (" +
                            std::to_string(cx) + "," + std::to_string(cy) + ") does not fit in " + args->a + " (" +
                            std::to_string(a.GetWidth()) + "x" + std::to_string(a.GetHeight()) + ")");

        // The computed entries are packed row by row over the search area clipped by B.
        const CPoint centre(static_cast<int>(cx), static_cast<int>(cy));
        const int r = args->radius, side = 2 * r + 1;
        const int uLo = std::max(centre.x - r, 0), uHi = std::min(centre.x + r, b.GetWidth() - 1);
        const int vLo = std::max(centre.y - r, 0), vHi = std::min(centre.y + r, b.GetHeight() - 1);
        const int computed = std::max(uHi - uLo + 1, 0) * std::max(vHi - vLo + 1, 0);

        std::printf("correlation table: radius %d, window %d, centre (%d,%d) in B\n", r, args->window, centre.x,
                    centre.y);
        if (computed == 0) {
            std::printf("the search area lies outside B: every entry holds %.6f\n", table.GetTable(0));
            return;
        }
        PrintTableGrid(table, centre, uLo, uHi, vLo, vHi);
        if (computed < side * side)
            std::printf("search area clipped by B: %d of %d entries computed; the other %d hold %.3g\n", computed,
                        side * side, side * side - computed, table.GetTable(side * side - 1));

        int best = 0;
        for (int i = 1; i < computed; ++i)
            if (table.GetTable(i) > table.GetTable(best)) best = i;
        const int columns = uHi - uLo + 1;
        const int u = uLo + best % columns, v = vLo + best / columns;
        std::printf("best offset: (%d,%d) from the centre, displacement (%d,%d) from the point, weight %.6f\n",
                    u - centre.x, v - centre.y, u - p.x, v - p.y, table.GetTable(best));
    });
}

// Whitespace- or comma-separated integers, one frequency per symbol.
std::vector<int> ReadHistogramFile(const std::string& path) {
    std::ifstream in(path);
    if (!in) throw ToolError(path + ": cannot open the histogram file");
    std::vector<int> histogram;
    std::string token;
    while (in >> token) {
        std::stringstream items(token);
        std::string item;
        while (std::getline(items, item, ',')) {
            if (item.empty()) continue;
            char* end = nullptr;
            errno = 0;
            const long long value = std::strtoll(item.c_str(), &end, 10);
            if (*end != '\0' || errno != 0 || value < INT_MIN || value > INT_MAX)
                throw ToolError(path + ": '" + item + "' is not a 32-bit integer frequency");
            histogram.push_back(static_cast<int>(value));
        }
    }
    if (histogram.empty()) throw ToolError(path + ": no frequencies in the file");
    return histogram;
}

// Frequencies of every pixel byte (all three bytes of a colour pixel).
std::vector<int> ImageByteHistogram(CImage& image) {
    std::vector<int> histogram(256, 0);
    const int rowBytes = image.GetWidth() * image.GetBitCount() / 8;
    for (int y = 0; y < image.GetHeight(); ++y) {
        const unsigned char* row = image.GetPtrXY(0, y);
        for (int i = 0; i < rowBytes; ++i) ++histogram[row[i]];
    }
    return histogram;
}

int CodeLength(unsigned code) { return 31 - __builtin_clz(code); }

std::string CodeWord(unsigned code) {
    std::string word;
    for (int bit = CodeLength(code) - 1; bit >= 0; --bit) word += ((code >> bit) & 1u) ? '1' : '0';
    return word.empty() ? "(empty)" : word;
}

void AddHuffmanCommand(CLI::App& app) {
    struct Args {
        std::string image, histogram;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand("huffman", "Huffman codes for the bytes of an image or for a histogram");
    CLI::Option* image = cmd->add_option("--image", args->image, "Image whose pixel bytes are counted");
    CLI::Option* histogram =
        cmd->add_option("--histogram", args->histogram, "Text file of frequencies, one per symbol (space or comma separated)");
    image->excludes(histogram);
    cmd->callback([args] {
        if (args->image.empty() == args->histogram.empty()) throw ToolError("give either --image or --histogram");
        std::vector<int> frequencies;
        int rawBitsPerSymbol = 8;
        if (!args->image.empty()) {
            CImage picture = LoadImage(args->image);
            frequencies = ImageByteHistogram(picture);
        } else {
            frequencies = ReadHistogramFile(args->histogram);
            rawBitsPerSymbol = 1;
            while ((1ULL << rawBitsPerSymbol) < frequencies.size()) ++rawBitsPerSymbol;
        }

        CHuffman huffman;
        if (!huffman.CodeBuild(frequencies.data(), static_cast<int>(frequencies.size())))
            throw ToolError("the codes cannot be built: the code tree would be deeper than 31 levels or its total "
                            "frequency exceeds 2^31 - 1");

        std::printf("%8s %12s %7s  %s\n", "symbol", "count", "length", "code");
        const SHuffmanCode* codes = huffman.GetCodes();
        unsigned long long codedBits = 0, occurrences = 0;
        int used = 0;
        for (int i = 0; i < huffman.GetSymbolCount(); ++i) {
            if (codes[i].symbol < 0) continue;
            const int length = CodeLength(codes[i].code);
            std::printf("%8d %12d %7d  %s\n", i, frequencies[i], length, CodeWord(codes[i].code).c_str());
            codedBits += static_cast<unsigned long long>(frequencies[i]) * length;
            occurrences += static_cast<unsigned long long>(frequencies[i]);
            ++used;
        }
        const unsigned long long rawBits = occurrences * rawBitsPerSymbol;
        std::printf("symbols used: %d of %zu, occurrences: %llu\n", used, frequencies.size(), occurrences);
        std::printf("coded size: %llu bits (%llu bytes), %.3f bits per symbol\n", codedBits, (codedBits + 7) / 8,
                    occurrences ? static_cast<double>(codedBits) / static_cast<double>(occurrences) : 0.0);
        std::printf("raw size:   %llu bits (%llu bytes), %d bits per symbol; coded/raw %.3f\n", rawBits,
                    (rawBits + 7) / 8, rawBitsPerSymbol,
                    rawBits ? static_cast<double>(codedBits) / static_cast<double>(rawBits) : 0.0);
    });
}

}  // namespace

void RegisterCodingCommands(CLI::App& app) {
    AddCorrelateCommand(app);
    AddHuffmanCommand(app);
}
