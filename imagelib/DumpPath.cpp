#include "imagelib/DumpPath.h"

#include <cctype>
#include <cstdlib>
#include <cwctype>
#include <string>
#include <vector>

namespace imagelib {

namespace {

std::string Narrow(const std::wstring& text) {
    std::string out;
    for (wchar_t c : text) out.push_back(c < 128 ? static_cast<char>(c) : '_');
    return out;
}

const char* DumpDirectory() {
    const char* dir = std::getenv("VARNOTH_DUMP_DIR");
    return dir != nullptr && dir[0] != '\0' ? dir : nullptr;
}

}  // namespace

bool IsDumpPath(const std::wstring& path) {
    const bool drive = path.size() >= 2 && path[1] == L':' && std::iswalpha(path[0]);
    return drive || path.find(L'\\') != std::wstring::npos;
}

bool DumpsEnabled() { return DumpDirectory() != nullptr; }

std::optional<std::string> ResolveOutputPath(const std::wstring& path) {
    if (!IsDumpPath(path)) return Narrow(path);
    const char* dir = DumpDirectory();
    if (dir == nullptr) return std::nullopt;

    std::string rest = Narrow(path.size() >= 2 && path[1] == L':' ? path.substr(2) : path);
    std::vector<std::string> parts;
    std::string part;
    for (char c : rest) {
        if (c == '\\' || c == '/') {
            if (!part.empty()) parts.push_back(part);
            part.clear();
        } else {
            part.push_back(c);
        }
    }
    if (part.empty() || part == "." || part == "..") return std::nullopt;
    std::string out = dir;
    for (const std::string& d : parts) {
        if (d == "." || d == "..") continue;  // a dump never climbs out of the dump directory
        std::string folded;
        for (char c : d) folded.push_back(static_cast<char>(std::tolower(static_cast<unsigned char>(c))));
        out += "/" + folded;
    }
    return out + "/" + part;
}

}  // namespace imagelib
