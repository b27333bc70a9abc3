#pragma once
// PNG and JPEG files to 32-bit pixels, the JPEG writer and a box-filter shrink.
// Pixels are 0xAARRGGBB words, rows top to bottom (the A8R8G8B8 order of textures).
// Files are read through the game pack; every decoder also reads from memory.
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ox::misc::imagelib {

// A decoded image; `pixels` holds width * height words.
struct Image {
    uint32_t width = 0;
    uint32_t height = 0;
    std::vector<uint32_t> pixels;
};

// The largest side and the most pixels a decoder accepts; bigger images are refused with
// a log line before any pixel memory is taken.
constexpr uint32_t kMaxImageSide = 16384;
// Lowers (or restores) the pixel count limit, for tools and fuzzing.
void SetMaxImagePixels(uint64_t pixels);
uint64_t GetMaxImagePixels();

class CImageDecoder {
public:
    // The size from the header alone. The base class knows no format: false.
    virtual bool GetInfo(const void* data, size_t size, uint32_t& width, uint32_t& height);
    // Reads the file through the game pack and calls GetInfo.
    virtual bool GetInfoFromFile(const char* path, uint32_t& width, uint32_t& height);
    // The whole image. On failure `image` is left empty.
    virtual bool Decode(const void* data, size_t size, Image& image);
    // Reads the file through the game pack and calls Decode.
    virtual bool DecodeFromFile(const char* path, Image& image);
    virtual ~CImageDecoder() = default;

    // The name log lines give the source: the file being read, the name set, or "<memory>".
    const char* SourceName() const { return m_Name.empty() ? "<memory>" : m_Name.c_str(); }
    void SetName(std::string name) { m_Name = std::move(name); }

protected:
    void SetSource(const void* data, size_t size);
    // Copies up to `count` bytes from the read position: what is left when fewer remain,
    // 0 at the end.
    size_t Read(void* buffer, size_t count);
    size_t Remaining() const { return m_Size - m_Position; }

    const uint8_t* m_Data = nullptr;
    size_t m_Size = 0;
    size_t m_Position = 0;
    std::string m_Name;
};

class CPNGDecoder : public CImageDecoder {
public:
    bool GetInfo(const void* data, size_t size, uint32_t& width, uint32_t& height) override;
    bool Decode(const void* data, size_t size, Image& image) override;
    // Chunk and stream checksums are verified unless turned off (fuzzing only).
    void SetCheckCrc(bool check) { m_CheckCrc = check; }

private:
    struct Callbacks;
    bool m_CheckCrc = true;
};

class CJPEGDecoder : public CImageDecoder {
public:
    static constexpr size_t kBlockSize = 4096;

    bool GetInfo(const void* data, size_t size, uint32_t& width, uint32_t& height) override;
    bool Decode(const void* data, size_t size, Image& image) override;

private:
    struct Source;
    void PrepareSource(Source& state);
    uint8_t m_Block[kBlockSize];
};

// The decoder for a path's extension (the text behind the last '.', any case): ".png" or
// ".jpg"; null for anything else.
std::unique_ptr<CImageDecoder> MakeDecoder(const char* path);

// The size of an image file; false for an unknown extension or a bad file.
bool GetImageInfo(const char* path, uint32_t& width, uint32_t& height);
// Decodes an image file; a path without any '.' is a contract failure.
bool LoadImage(const char* path, Image& image);
// Decodes a PNG or JPEG file on disk, outside any game pack (content tools). False with the
// reason, naming the file, in `error`.
bool DecodeImageOnDisk(const std::string& path, Image& image, std::string& error);

// Encodes RGB JPEG data (alpha is dropped; `grey` writes one channel of luma,
// `progressive` a progressive file). The quality is capped at 100.
bool EncodeJpeg(const uint32_t* pixels, uint32_t width, uint32_t height, int quality,
                std::vector<uint8_t>& out, bool grey = false, bool progressive = false);
// Writes an RGB JPEG file (a UTF-8 path on disk).
bool CompressJpegFile(const char* path, const uint32_t* pixels, uint32_t width, uint32_t height, int quality);

// Shrinks `_source` into `_destination` (new_width * new_height words) by box filtering:
// each target pixel is the mean of the trunc(sx) x trunc(sy) source pixels at its place,
// sx = width / new_width and sy = height / new_height. When enlarging, the box is one
// pixel. A new width of 0 or a new height of 0 does nothing.
void ResampleImage(const uint32_t* _source, uint32_t _width, uint32_t _height, uint32_t* _destination,
                   uint32_t _new_width, uint32_t _new_height);

} // namespace ox::misc::imagelib
