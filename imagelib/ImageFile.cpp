// File formats of the image library: BMP (own code: it is the pixel layout itself), PNG,
// JPEG and TIFF through libpng, libjpeg-turbo and libtiff.
#include <png.h>
#include <tiffio.h>

#include <cstdio>
// jpeglib.h needs FILE and size_t declared first.
#include <jpeglib.h>
#include <jerror.h>

#include <algorithm>
#include <csetjmp>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "imagelib/CImage.h"
#include "imagelib/DumpPath.h"

namespace {

using FilePtr = std::unique_ptr<FILE, int (*)(FILE*)>;

FilePtr OpenFile(const std::string& path, const char* mode) { return FilePtr(std::fopen(path.c_str(), mode), &std::fclose); }

std::string Extension(const std::string& path) {
    const size_t dot = path.find_last_of('.');
    const size_t slash = path.find_last_of('/');
    if (dot == std::string::npos || (slash != std::string::npos && dot < slash)) return "";
    std::string ext = path.substr(dot + 1);
    for (char& c : ext) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return ext;
}

void SetError(std::string* error, const std::string& text) {
    if (error != nullptr) *error = text;
}

// A file header may claim any size; reading stops at 2^28 pixels (about 16 times an A4 page at
// 300 dpi) so that a small crafted file cannot demand gigabytes.
bool SizeAcceptable(uint64_t width, uint64_t height) {
    return width > 0 && height > 0 && width <= 65535 && height <= 65535 && width * height <= (uint64_t(1) << 28);
}

// ---- BMP ----------------------------------------------------------------------------

void Put16(std::vector<unsigned char>& b, uint16_t v) { b.push_back(v & 0xFF); b.push_back(v >> 8); }
void Put32(std::vector<unsigned char>& b, uint32_t v) { for (int i = 0; i < 4; ++i) b.push_back((v >> (8 * i)) & 0xFF); }
uint32_t Get32(const unsigned char* p) { return p[0] | (p[1] << 8) | (p[2] << 16) | (static_cast<uint32_t>(p[3]) << 24); }
uint16_t Get16(const unsigned char* p) { return static_cast<uint16_t>(p[0] | (p[1] << 8)); }

bool WriteBmp(const CImage& img, const std::string& path) {
    if (img.GetBitCount() != 8 && img.GetBitCount() != 24) return false;
    const uint32_t paletteBytes = img.GetBitCount() == 8 ? 1024 : 0;
    const uint32_t offset = 14 + 40 + paletteBytes;
    std::vector<unsigned char> header;
    header.push_back('B');
    header.push_back('M');
    Put32(header, offset + static_cast<uint32_t>(img.GetSize()));
    Put32(header, 0);
    Put32(header, offset);
    Put32(header, 40);
    Put32(header, static_cast<uint32_t>(img.GetWidth()));
    Put32(header, static_cast<uint32_t>(img.GetHeight()));  // positive: bottom-up, as stored
    Put16(header, 1);
    Put16(header, static_cast<uint16_t>(img.GetBitCount()));
    Put32(header, 0);
    Put32(header, static_cast<uint32_t>(img.GetSize()));
    Put32(header, 2835);
    Put32(header, 2835);
    Put32(header, paletteBytes ? 256 : 0);
    Put32(header, 0);
    for (uint32_t i = 0; i < paletteBytes / 4; ++i) {
        const COLORREF c = img.GetPaletteColor(static_cast<int>(i));
        header.push_back((c >> 16) & 0xFF);  // B
        header.push_back((c >> 8) & 0xFF);   // G
        header.push_back(c & 0xFF);          // R
        header.push_back(0);
    }
    FilePtr f = OpenFile(path, "wb");
    if (!f) return false;
    if (std::fwrite(header.data(), 1, header.size(), f.get()) != header.size()) return false;
    return std::fwrite(img.GetBits(), 1, img.GetSize(), f.get()) == img.GetSize();
}

bool ReadBmp(const std::string& path, CImage& out, std::string* error) {
    std::ifstream in(path, std::ios::binary);
    std::vector<unsigned char> data((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    if (data.size() < 54 || data[0] != 'B' || data[1] != 'M') return SetError(error, "not a BMP file"), false;
    const uint32_t offset = Get32(&data[10]), infoSize = Get32(&data[14]);
    const int32_t width = static_cast<int32_t>(Get32(&data[18]));
    const int32_t rawHeight = static_cast<int32_t>(Get32(&data[22]));
    const int bits = Get16(&data[28]);
    const uint32_t compression = Get32(&data[30]);
    if (compression != 0) return SetError(error, "compressed BMP files are not supported"), false;
    if (bits != 8 && bits != 24 && bits != 32) return SetError(error, "BMP depth " + std::to_string(bits) + " is not supported"), false;
    const int height = rawHeight < 0 ? -rawHeight : rawHeight;
    if (width <= 0 || !SizeAcceptable(static_cast<uint64_t>(width), static_cast<uint64_t>(height)))
        return SetError(error, "BMP size out of range"), false;
    const size_t srcSpan = ((static_cast<size_t>(width) * bits / 8) + 3) & ~size_t(3);
    if (offset > data.size() || data.size() - offset < srcSpan * height) return SetError(error, "truncated BMP file"), false;

    std::vector<COLORREF> palette(256);
    bool grey = true;
    if (bits == 8) {
        uint32_t colours = Get32(&data[46]);
        if (colours == 0 || colours > 256) colours = 256;
        const size_t at = 14 + infoSize;
        for (uint32_t i = 0; i < colours && at + 4 * i + 3 < data.size(); ++i) {
            const unsigned char* p = &data[at + 4 * i];
            palette[i] = RGB(p[2], p[1], p[0]);
            if (p[0] != i || p[1] != i || p[2] != i) grey = false;
        }
    }
    const int outBits = (bits == 8 && grey) ? 8 : 24;
    CImage img(width, height, outBits);
    for (int y = 0; y < height; ++y) {
        const int fileRow = rawHeight < 0 ? y : height - 1 - y;  // file rows bottom-up unless height < 0
        const unsigned char* src = &data[offset + srcSpan * fileRow];
        unsigned char* dst = img.GetPtrXY(0, y);
        for (int x = 0; x < width; ++x) {
            if (outBits == 8) {
                dst[x] = src[x];
            } else if (bits == 8) {
                const COLORREF c = palette[src[x]];
                dst[3 * x] = (c >> 16) & 0xFF;
                dst[3 * x + 1] = (c >> 8) & 0xFF;
                dst[3 * x + 2] = c & 0xFF;
            } else {
                std::memcpy(dst + 3 * x, src + (bits / 8) * x, 3);
            }
        }
    }
    out = std::move(img);
    return true;
}

// ---- PNG ----------------------------------------------------------------------------

bool WritePng(const CImage& img, const std::string& path) {
    const int bits = img.GetBitCount();
    FilePtr f = OpenFile(path, "wb");
    if (!f) return false;
    png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png ? png_create_info_struct(png) : nullptr;
    if (!info) {
        png_destroy_write_struct(&png, nullptr);
        return false;
    }
    if (setjmp(png_jmpbuf(png))) {
        png_destroy_write_struct(&png, &info);
        return false;
    }
    png_init_io(png, f.get());
    const int colourType = bits == 24 ? PNG_COLOR_TYPE_RGB : PNG_COLOR_TYPE_GRAY;
    png_set_IHDR(png, info, img.GetWidth(), img.GetHeight(), bits == 16 ? 16 : 8, colourType, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    png_set_compression_level(png, 3);
    png_write_info(png, info);
    if (bits == 24) png_set_bgr(png);
    if (bits == 16) png_set_swap(png);  // our 16-bit values are little-endian
    for (int y = 0; y < img.GetHeight(); ++y) png_write_row(png, const_cast<png_bytep>(img.GetPtrXY(0, y)));
    png_write_end(png, nullptr);
    png_destroy_write_struct(&png, &info);
    return true;
}

bool ReadPng(const std::string& path, CImage& out, std::string* error) {
    FilePtr f = OpenFile(path, "rb");
    if (!f) return SetError(error, "cannot open file"), false;
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png ? png_create_info_struct(png) : nullptr;
    if (!info) {
        png_destroy_read_struct(&png, nullptr, nullptr);
        return SetError(error, "out of memory"), false;
    }
    // Everything with a destructor lives from before the jump point, so a jump back skips none.
    CImage img;
    std::vector<png_bytep> rows;
    if (setjmp(png_jmpbuf(png))) {
        png_destroy_read_struct(&png, &info, nullptr);
        return SetError(error, "corrupt or unsupported PNG file"), false;
    }
    png_init_io(png, f.get());
    png_read_info(png, info);
    const int colourType = png_get_color_type(png, info);
    png_set_strip_16(png);
    png_set_packing(png);
    png_set_strip_alpha(png);
    if (colourType == PNG_COLOR_TYPE_PALETTE) png_set_palette_to_rgb(png);
    if (colourType == PNG_COLOR_TYPE_GRAY && png_get_bit_depth(png, info) < 8) png_set_expand_gray_1_2_4_to_8(png);
    png_set_bgr(png);
    png_set_interlace_handling(png);
    png_read_update_info(png, info);
    const int channels = png_get_channels(png, info);
    const png_uint_32 w = png_get_image_width(png, info), h = png_get_image_height(png, info);
    if (!SizeAcceptable(w, h) || (channels != 1 && channels != 3)) {
        png_destroy_read_struct(&png, &info, nullptr);
        return SetError(error, "unsupported PNG layout"), false;
    }
    img.Reallocate(static_cast<int>(w), static_cast<int>(h), channels * 8);
    rows.resize(h);
    for (png_uint_32 y = 0; y < h; ++y) rows[y] = img.GetPtrXY(0, static_cast<int>(y));
    png_read_image(png, rows.data());
    png_read_end(png, nullptr);
    png_destroy_read_struct(&png, &info, nullptr);
    out = std::move(img);
    return true;
}

// ---- JPEG ---------------------------------------------------------------------------

struct JpegError {
    jpeg_error_mgr mgr;
    std::jmp_buf jump;
    bool truncated = false;
};

void JpegErrorExit(j_common_ptr cinfo) { std::longjmp(reinterpret_cast<JpegError*>(cinfo->err)->jump, 1); }

// The decoder only warns when the data ends early and fills the rest with grey; a cut file is
// refused instead of handing back an invented lower part.
void JpegMessage(j_common_ptr cinfo, int level) {
    if (level < 0 && cinfo->err->msg_code == JWRN_JPEG_EOF) reinterpret_cast<JpegError*>(cinfo->err)->truncated = true;
}

bool WriteJpeg(const CImage& img, const std::string& path) {
    if (img.GetBitCount() != 8 && img.GetBitCount() != 24) return false;
    FilePtr f = OpenFile(path, "wb");
    if (!f) return false;
    jpeg_compress_struct cinfo;
    JpegError err;
    cinfo.err = jpeg_std_error(&err.mgr);
    err.mgr.error_exit = JpegErrorExit;
    std::vector<unsigned char> rgb(static_cast<size_t>(img.GetWidth()) * 3);
    if (setjmp(err.jump)) {
        jpeg_destroy_compress(&cinfo);
        return false;
    }
    jpeg_create_compress(&cinfo);
    jpeg_stdio_dest(&cinfo, f.get());
    cinfo.image_width = static_cast<JDIMENSION>(img.GetWidth());
    cinfo.image_height = static_cast<JDIMENSION>(img.GetHeight());
    cinfo.input_components = img.GetBitCount() / 8;
    cinfo.in_color_space = img.GetBitCount() == 24 ? JCS_RGB : JCS_GRAYSCALE;
    jpeg_set_defaults(&cinfo);
    jpeg_set_quality(&cinfo, 92, TRUE);
    jpeg_start_compress(&cinfo, TRUE);
    for (int y = 0; y < img.GetHeight(); ++y) {
        const unsigned char* row = img.GetPtrXY(0, y);
        JSAMPROW sample = const_cast<JSAMPROW>(row);
        if (img.GetBitCount() == 24) {
            for (int x = 0; x < img.GetWidth(); ++x) {
                rgb[3 * x] = row[3 * x + 2];
                rgb[3 * x + 1] = row[3 * x + 1];
                rgb[3 * x + 2] = row[3 * x];
            }
            sample = rgb.data();
        }
        jpeg_write_scanlines(&cinfo, &sample, 1);
    }
    jpeg_finish_compress(&cinfo);
    jpeg_destroy_compress(&cinfo);
    return true;
}

bool ReadJpeg(const std::string& path, CImage& out, std::string* error) {
    FilePtr f = OpenFile(path, "rb");
    if (!f) return SetError(error, "cannot open file"), false;
    jpeg_decompress_struct cinfo;
    JpegError err;
    cinfo.err = jpeg_std_error(&err.mgr);
    err.mgr.error_exit = JpegErrorExit;
    err.mgr.emit_message = JpegMessage;
    CImage img;
    if (setjmp(err.jump)) {
        jpeg_destroy_decompress(&cinfo);
        return SetError(error, "corrupt or unsupported JPEG file"), false;
    }
    jpeg_create_decompress(&cinfo);
    jpeg_stdio_src(&cinfo, f.get());
    jpeg_read_header(&cinfo, TRUE);
    if (cinfo.jpeg_color_space == JCS_CMYK || cinfo.jpeg_color_space == JCS_YCCK) {
        jpeg_destroy_decompress(&cinfo);
        return SetError(error, "CMYK JPEG files are not supported"), false;
    }
    const bool grey = cinfo.num_components == 1;
    cinfo.out_color_space = grey ? JCS_GRAYSCALE : JCS_EXT_BGR;
    jpeg_start_decompress(&cinfo);
    if (!SizeAcceptable(cinfo.output_width, cinfo.output_height)) {
        jpeg_destroy_decompress(&cinfo);
        return SetError(error, "JPEG size out of range"), false;
    }
    img.Reallocate(static_cast<int>(cinfo.output_width), static_cast<int>(cinfo.output_height), grey ? 8 : 24);
    while (cinfo.output_scanline < cinfo.output_height) {
        JSAMPROW row = img.GetPtrXY(0, static_cast<int>(cinfo.output_scanline));
        jpeg_read_scanlines(&cinfo, &row, 1);
    }
    jpeg_finish_decompress(&cinfo);
    jpeg_destroy_decompress(&cinfo);
    if (err.truncated) return SetError(error, "the JPEG file is cut short"), false;
    out = std::move(img);
    return true;
}

// ---- TIFF ---------------------------------------------------------------------------

bool WriteTiff(const CImage& img, const std::string& path) {
    TIFF* tif = TIFFOpen(path.c_str(), "w");
    if (tif == nullptr) return false;
    const int bits = img.GetBitCount();
    const int samples = bits == 24 ? 3 : 1;
    TIFFSetField(tif, TIFFTAG_IMAGEWIDTH, static_cast<uint32_t>(img.GetWidth()));
    TIFFSetField(tif, TIFFTAG_IMAGELENGTH, static_cast<uint32_t>(img.GetHeight()));
    TIFFSetField(tif, TIFFTAG_SAMPLESPERPIXEL, samples);
    TIFFSetField(tif, TIFFTAG_BITSPERSAMPLE, bits == 16 ? 16 : 8);
    TIFFSetField(tif, TIFFTAG_PHOTOMETRIC, samples == 3 ? PHOTOMETRIC_RGB : PHOTOMETRIC_MINISBLACK);
    TIFFSetField(tif, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
    TIFFSetField(tif, TIFFTAG_COMPRESSION, COMPRESSION_LZW);
    TIFFSetField(tif, TIFFTAG_ROWSPERSTRIP, 64);
    std::vector<unsigned char> row(static_cast<size_t>(img.GetSpan()));
    bool ok = true;
    for (int y = 0; y < img.GetHeight() && ok; ++y) {
        std::memcpy(row.data(), img.GetPtrXY(0, y), row.size());
        if (samples == 3)
            for (int x = 0; x < img.GetWidth(); ++x) std::swap(row[3 * x], row[3 * x + 2]);
        ok = TIFFWriteScanline(tif, row.data(), static_cast<uint32_t>(y), 0) >= 0;
    }
    TIFFClose(tif);
    return ok;
}

bool ReadTiff(const std::string& path, CImage& out, std::string* error) {
    TIFFSetErrorHandler(nullptr);
    TIFFSetWarningHandler(nullptr);
    TIFF* tif = TIFFOpen(path.c_str(), "r");
    if (tif == nullptr) return SetError(error, "cannot read TIFF file"), false;
    uint32_t w = 0, h = 0;
    uint16_t bps = 0, spp = 0, photometric = 0;
    TIFFGetField(tif, TIFFTAG_IMAGEWIDTH, &w);
    TIFFGetField(tif, TIFFTAG_IMAGELENGTH, &h);
    TIFFGetFieldDefaulted(tif, TIFFTAG_BITSPERSAMPLE, &bps);
    TIFFGetFieldDefaulted(tif, TIFFTAG_SAMPLESPERPIXEL, &spp);
    TIFFGetFieldDefaulted(tif, TIFFTAG_PHOTOMETRIC, &photometric);
    if (!SizeAcceptable(w, h)) {
        TIFFClose(tif);
        return SetError(error, "TIFF size out of range"), false;
    }
    CImage img;
    bool ok = true;
    if (spp == 1 && bps == 8 && photometric == PHOTOMETRIC_MINISBLACK && !TIFFIsTiled(tif)) {
        img.Reallocate(static_cast<int>(w), static_cast<int>(h), 8);
        for (uint32_t y = 0; y < h && ok; ++y) ok = TIFFReadScanline(tif, img.GetPtrXY(0, static_cast<int>(y)), y, 0) >= 0;
    } else {
        std::vector<uint32_t> rgba(static_cast<size_t>(w) * h);
        ok = TIFFReadRGBAImageOriented(tif, w, h, rgba.data(), ORIENTATION_TOPLEFT, 0) != 0;
        if (ok) {
            img.Reallocate(static_cast<int>(w), static_cast<int>(h), 24);
            for (uint32_t y = 0; y < h; ++y) {
                unsigned char* dst = img.GetPtrXY(0, static_cast<int>(y));
                for (uint32_t x = 0; x < w; ++x) {
                    const uint32_t p = rgba[static_cast<size_t>(y) * w + x];
                    dst[3 * x] = static_cast<unsigned char>(TIFFGetB(p));
                    dst[3 * x + 1] = static_cast<unsigned char>(TIFFGetG(p));
                    dst[3 * x + 2] = static_cast<unsigned char>(TIFFGetR(p));
                }
            }
        }
    }
    TIFFClose(tif);
    if (!ok) return SetError(error, "corrupt or unsupported TIFF file"), false;
    out = std::move(img);
    return true;
}

bool WriteByExtension(const CImage& img, const std::string& path) {
    const std::string ext = Extension(path);
    if (ext == "bmp") return WriteBmp(img, path);
    if (ext == "png") return WritePng(img, path);
    if (ext == "jpg" || ext == "jpeg") return WriteJpeg(img, path);
    if (ext == "tif" || ext == "tiff") return WriteTiff(img, path);
    return false;
}

}  // namespace

bool CImage::ExportFile(const wchar_t* path) const {
    if (path == nullptr) return false;
    const std::optional<std::string> target = imagelib::ResolveOutputPath(path);
    if (!target) return false;  // a debug dump with no dump directory: nothing to do
    if (imagelib::IsDumpPath(path)) {
        // Dumps name fixed folders ("results", "zentlogdir") that a fresh dump directory lacks.
        std::error_code ec;
        const std::filesystem::path parent = std::filesystem::path(*target).parent_path();
        if (!parent.empty()) std::filesystem::create_directories(parent, ec);
    }
    return ExportFile(*target);
}

bool CImage::ExportFile(const std::string& path) const {
    if (m_pixels == nullptr || path.empty()) return false;
    try {
        std::error_code ec;
        const bool ok = WriteByExtension(*this, path);
        if (!ok) std::filesystem::remove(path, ec);
        return ok;
    } catch (...) {
        return false;
    }
}

bool CImage::ImportFile(const std::string& path, std::string* error) {
    try {
        std::error_code ec;
        if (!std::filesystem::is_regular_file(path, ec)) return SetError(error, "no such file"), false;
        FilePtr f = OpenFile(path, "rb");
        unsigned char magic[4] = {0, 0, 0, 0};
        if (!f || std::fread(magic, 1, 4, f.get()) < 2) return SetError(error, "cannot read file"), false;
        f.reset();
        CImage img;
        bool ok;
        if (magic[0] == 'B' && magic[1] == 'M') {
            ok = ReadBmp(path, img, error);
        } else if (magic[0] == 0x89 && magic[1] == 'P') {
            ok = ReadPng(path, img, error);
        } else if (magic[0] == 0xFF && magic[1] == 0xD8) {
            ok = ReadJpeg(path, img, error);
        } else if ((magic[0] == 'I' && magic[1] == 'I') || (magic[0] == 'M' && magic[1] == 'M')) {
            ok = ReadTiff(path, img, error);
        } else {
            return SetError(error, "unsupported file format (expected PNG, JPEG, BMP or TIFF)"), false;
        }
        if (ok) *this = std::move(img);
        return ok;
    } catch (const std::exception& e) {
        return SetError(error, e.what()), false;
    }
}
