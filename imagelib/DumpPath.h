#pragma once

#include <optional>
#include <string>

#include "imagelib/ImageLibExport.h"

namespace imagelib {

// Debug dumps are named with Windows paths ("c:\ZentLogDir\X.bmp", "\results\Y.bmp").
// Such a path is written under $VARNOTH_DUMP_DIR (read at every call) with the drive
// dropped, backslashes as separators and directory names folded to lower case; the file
// name keeps its case. When the variable is unset or empty there is nowhere to write and
// the result is empty. A plain POSIX path is returned as it is.
CIMAGE_API std::optional<std::string> ResolveOutputPath(const std::wstring& path);

// True when `path` names a debug dump (drive prefix or backslash).
CIMAGE_API bool IsDumpPath(const std::wstring& path);

// True when a debug dump would be written now (the dump directory is set), so callers can
// skip building debug pictures nobody asked for.
CIMAGE_API bool DumpsEnabled();

}  // namespace imagelib
