// JPEG through libjpeg, both ways. The library's default error handler ends the process;
// ours logs and jumps back to the setjmp of the step that was running, which then gives
// false. As for PNG, the steps are plain functions with nothing that has a destructor, and
// the C++ objects live in their callers.
#include "misc/imagelib/ImageLib.h"

#include "diag/Log.h"

#include <algorithm>
#include <csetjmp>
#include <cstdio>
#include <cstdlib>
#include <cstring>
// clang-format off
#include <jpeglib.h>
#include <jerror.h>
// clang-format on

namespace ox::misc::imagelib {

namespace {

constexpr const char* kChannel = "imagelib";
// A progressive file needs about ten scans; thousands only cost time.
constexpr int kMaxScans = 256;

struct ErrorManager {
    jpeg_error_mgr pub;
    jmp_buf jump;
    const char* name;
};

void ErrorExit(j_common_ptr cinfo)
{
    auto* err = reinterpret_cast<ErrorManager*>(cinfo->err);
    char text[JMSG_LENGTH_MAX];
    (*cinfo->err->format_message)(cinfo, text);
    OX_LOG(kChannel, diag::LogError, "JPEG error in \"%s\": %s", err->name, text);
    longjmp(err->jump, 1);
}

void OutputMessage(j_common_ptr cinfo)
{
    auto* err = reinterpret_cast<ErrorManager*>(cinfo->err);
    char text[JMSG_LENGTH_MAX];
    (*cinfo->err->format_message)(cinfo, text);
    OX_LOG(kChannel, diag::LogWarning, "JPEG warning in \"%s\": %s", err->name, text);
}

void InstallErrorManager(ErrorManager& err, const char* name)
{
    jpeg_std_error(&err.pub);
    err.pub.error_exit = ErrorExit;
    err.pub.output_message = OutputMessage;
    err.name = name;
}

void ProgressMonitor(j_common_ptr cinfo)
{
    if (!cinfo->is_decompressor)
        return;
    auto* dinfo = reinterpret_cast<j_decompress_ptr>(cinfo);
    if (dinfo->input_scan_number > kMaxScans) {
        auto* err = reinterpret_cast<ErrorManager*>(cinfo->err);
        OX_LOG(kChannel, diag::LogError, "JPEG error in \"%s\": more than %d scans", err->name, kMaxScans);
        longjmp(err->jump, 1);
    }
}

bool AcceptSize(const char* name, uint32_t width, uint32_t height)
{
    if (width && height && width <= kMaxImageSide && height <= kMaxImageSide &&
        uint64_t(width) * height <= GetMaxImagePixels())
        return true;
    OX_LOG(kChannel, diag::LogError, "JPEG error in \"%s\": %ux%u pixels are not accepted", name, width, height);
    return false;
}

} // namespace

// Everything one decode needs from the library, in one block with no destructor.
struct CJPEGDecoder::Source {
    jpeg_decompress_struct cinfo;
    jpeg_source_mgr manager;
    jpeg_progress_mgr progress;
    ErrorManager err;
    CJPEGDecoder* decoder;
    bool created;

    static Source* Of(j_decompress_ptr cinfo) { return static_cast<Source*>(cinfo->client_data); }

    static void Init(j_decompress_ptr) {}
    static void Term(j_decompress_ptr) {}

    // The next block of the data; at its end, a warning and an inserted end-of-image marker.
    static boolean Fill(j_decompress_ptr cinfo)
    {
        CJPEGDecoder* decoder = Of(cinfo)->decoder;
        size_t n = decoder->Read(decoder->m_Block, kBlockSize);
        if (n == 0) {
            WARNMS(cinfo, JWRN_JPEG_EOF);
            decoder->m_Block[0] = 0xFF;
            decoder->m_Block[1] = JPEG_EOI;
            n = 2;
        }
        cinfo->src->next_input_byte = decoder->m_Block;
        cinfo->src->bytes_in_buffer = n;
        return TRUE;
    }

    static void Skip(j_decompress_ptr cinfo, long count)
    {
        if (count <= 0)
            return;
        jpeg_source_mgr* src = cinfo->src;
        if (size_t(count) <= src->bytes_in_buffer) {
            src->next_input_byte += count;
            src->bytes_in_buffer -= size_t(count);
            return;
        }
        CJPEGDecoder* decoder = Of(cinfo)->decoder;
        size_t rest = size_t(count) - src->bytes_in_buffer;
        decoder->m_Position += std::min(rest, decoder->Remaining());
        src->bytes_in_buffer = 0;
    }

    // Creates the decompressor and reads the header; with `start`, also begins decoding to
    // RGB. Gives false after a library error.
    static bool Start(Source* s, bool start, uint32_t* width, uint32_t* height)
    {
        if (setjmp(s->err.jump))
            return false;
        jpeg_create_decompress(&s->cinfo);
        s->created = true;
        s->cinfo.client_data = s;
        s->manager.init_source = Init;
        s->manager.fill_input_buffer = Fill;
        s->manager.skip_input_data = Skip;
        s->manager.resync_to_restart = jpeg_resync_to_restart;
        s->manager.term_source = Term;
        s->manager.bytes_in_buffer = 0;
        s->manager.next_input_byte = nullptr;
        s->cinfo.src = &s->manager;
        s->progress.progress_monitor = ProgressMonitor;
        s->cinfo.progress = &s->progress;

        jpeg_read_header(&s->cinfo, TRUE);
        *width = s->cinfo.image_width;
        *height = s->cinfo.image_height;
        if (!start)
            return true;
        if (!AcceptSize(s->err.name, *width, *height))
            return false;
        // Grey files are widened to RGB by the library.
        s->cinfo.out_color_space = JCS_RGB;
        jpeg_start_decompress(&s->cinfo);
        if (s->cinfo.output_components != 3 || s->cinfo.output_width != *width ||
            s->cinfo.output_height != *height) {
            OX_LOG(kChannel, diag::LogError, "JPEG error in \"%s\": unexpected output layout", s->err.name);
            return false;
        }
        return true;
    }

    // Each scan line of three components becomes a row of opaque pixels.
    static bool ReadLines(Source* s, uint32_t* pixels)
    {
        if (setjmp(s->err.jump))
            return false;
        j_decompress_ptr cinfo = &s->cinfo;
        const JDIMENSION width = cinfo->output_width;
        JSAMPARRAY line = (*cinfo->mem->alloc_sarray)(reinterpret_cast<j_common_ptr>(cinfo), JPOOL_IMAGE,
                                                      width * 3, 1);
        while (cinfo->output_scanline < cinfo->output_height) {
            uint32_t* row = pixels + size_t(cinfo->output_scanline) * width;
            if (jpeg_read_scanlines(cinfo, line, 1) != 1) {
                OX_LOG(kChannel, diag::LogError, "JPEG error in \"%s\": no scan line", s->err.name);
                return false;
            }
            const JSAMPLE* p = line[0];
            for (JDIMENSION x = 0; x < width; ++x, p += 3)
                row[x] = 0xFF000000u | uint32_t(p[0]) << 16 | uint32_t(p[1]) << 8 | p[2];
        }
        jpeg_finish_decompress(cinfo);
        return true;
    }
};

namespace {

// Frees the decompressor whatever way a decode ends.
template <class State>
struct DecompressGuard {
    State& state;
    ~DecompressGuard()
    {
        if (state.created)
            jpeg_destroy_decompress(&state.cinfo);
    }
};

} // namespace

void CJPEGDecoder::PrepareSource(Source& state)
{
    memset(&state, 0, sizeof(state));
    state.decoder = this;
    InstallErrorManager(state.err, SourceName());
    state.cinfo.err = &state.err.pub;
}

bool CJPEGDecoder::GetInfo(const void* data, size_t size, uint32_t& width, uint32_t& height)
{
    SetSource(data, size);
    Source state;
    PrepareSource(state);
    DecompressGuard<Source> guard{state};
    uint32_t w = 0, h = 0;
    if (!Source::Start(&state, false, &w, &h))
        return false;
    width = w;
    height = h;
    return true;
}

bool CJPEGDecoder::Decode(const void* data, size_t size, Image& image)
{
    image = Image{};
    SetSource(data, size);
    Source state;
    PrepareSource(state);
    DecompressGuard<Source> guard{state};
    uint32_t width = 0, height = 0;
    if (!Source::Start(&state, true, &width, &height))
        return false;
    std::vector<uint32_t> pixels(size_t(width) * height);
    if (!Source::ReadLines(&state, pixels.data()))
        return false;
    image.width = width;
    image.height = height;
    image.pixels = std::move(pixels);
    return true;
}

namespace {

struct CompressState {
    jpeg_compress_struct cinfo;
    ErrorManager err;
    unsigned char* buffer;
    unsigned long size;
    bool created;
};

bool Compress(CompressState* s, const uint32_t* pixels, uint32_t width, uint32_t height, int quality, bool grey,
              bool progressive)
{
    if (setjmp(s->err.jump))
        return false;
    jpeg_create_compress(&s->cinfo);
    s->created = true;
    jpeg_mem_dest(&s->cinfo, &s->buffer, &s->size);
    s->cinfo.image_width = width;
    s->cinfo.image_height = height;
    s->cinfo.input_components = 3;
    s->cinfo.in_color_space = JCS_RGB;
    jpeg_set_defaults(&s->cinfo);
    if (grey)
        jpeg_set_colorspace(&s->cinfo, JCS_GRAYSCALE);
    jpeg_set_quality(&s->cinfo, quality, TRUE);
    if (progressive)
        jpeg_simple_progression(&s->cinfo);
    jpeg_start_compress(&s->cinfo, TRUE);
    JSAMPARRAY line = (*s->cinfo.mem->alloc_sarray)(reinterpret_cast<j_common_ptr>(&s->cinfo), JPOOL_IMAGE,
                                                    width * 3, 1);
    while (s->cinfo.next_scanline < height) {
        const uint32_t* row = pixels + size_t(s->cinfo.next_scanline) * width;
        JSAMPLE* p = line[0];
        for (uint32_t x = 0; x < width; ++x, p += 3) {
            p[0] = JSAMPLE(row[x] >> 16);
            p[1] = JSAMPLE(row[x] >> 8);
            p[2] = JSAMPLE(row[x]);
        }
        jpeg_write_scanlines(&s->cinfo, line, 1);
    }
    jpeg_finish_compress(&s->cinfo);
    return true;
}

} // namespace

bool EncodeJpeg(const uint32_t* pixels, uint32_t width, uint32_t height, int quality, std::vector<uint8_t>& out,
                bool grey, bool progressive)
{
    out.clear();
    if (!pixels || width == 0 || height == 0 || width > 65500 || height > 65500) {
        OX_LOG(kChannel, diag::LogError, "JPEG: cannot write an image of %ux%u pixels", width, height);
        return false;
    }
    CompressState state;
    memset(&state, 0, sizeof(state));
    InstallErrorManager(state.err, "<memory>");
    state.cinfo.err = &state.err.pub;
    bool ok = Compress(&state, pixels, width, height, std::clamp(quality, 0, 100), grey, progressive);
    if (state.created)
        jpeg_destroy_compress(&state.cinfo);
    // The memory destination hands its final block over only when it finishes; after an
    // error (out of memory) the pointer may be stale, so it is not freed then.
    if (ok) {
        out.assign(state.buffer, state.buffer + state.size);
        free(state.buffer);
    }
    return ok;
}

bool CompressJpegFile(const char* path, const uint32_t* pixels, uint32_t width, uint32_t height, int quality)
{
    std::vector<uint8_t> data;
    if (!EncodeJpeg(pixels, width, height, quality, data))
        return false;
    FILE* file = fopen(path, "wb");
    bool ok = file && fwrite(data.data(), 1, data.size(), file) == data.size();
    if (file && fclose(file) != 0)
        ok = false;
    if (!ok)
        OX_LOG(kChannel, diag::LogError, "Cannot write the JPEG file \"%s\"", path);
    return ok;
}

} // namespace ox::misc::imagelib
