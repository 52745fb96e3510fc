#include "wxjng/Jpeg.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "wxjng/Chunks.h"

#include <csetjmp>
#include <cstdio>
#include <cstdlib>
#include <jpeglib.h>

namespace wxjng {

namespace {

// A progressive picture may have any number of scans, each of which costs as much as decoding the picture.
constexpr int kMaximalScans = 200;

// The library calls back for a fatal error and expects no return.
struct SErrors : jpeg_error_mgr {
    std::jmp_buf jump;

    template <class Info> void attach(Info& info) {
        info.err = jpeg_std_error(this);
        error_exit = [](j_common_ptr failed) { std::longjmp(static_cast<SErrors*>(failed->err)->jump, 1); };
        output_message = [](j_common_ptr) {};
    }
};

class CEncoder {
public:
    CEncoder() {
        m_errors.attach(m_info);
        jpeg_create_compress(&m_info);
    }
    ~CEncoder() {
        jpeg_destroy_compress(&m_info);
        std::free(m_bytes);
    }
    CEncoder(const CEncoder&) = delete;
    CEncoder& operator=(const CEncoder&) = delete;

    std::string_view getBytes() const { return {reinterpret_cast<const char*>(m_bytes), m_size}; }

    // False after an error of the library. No local variable may need a destructor.
    bool encode(const SSamples& picture, int quality) {
        if (setjmp(m_errors.jump)) {
            m_bytes = nullptr; // the library may have released the buffer for a larger one
            return false;
        }
        jpeg_mem_dest(&m_info, &m_bytes, &m_size);
        m_info.image_width = static_cast<JDIMENSION>(picture.width);
        m_info.image_height = static_cast<JDIMENSION>(picture.height);
        m_info.input_components = picture.channels;
        m_info.in_color_space = picture.channels == 1 ? JCS_GRAYSCALE : JCS_RGB;
        jpeg_set_defaults(&m_info);
        jpeg_set_quality(&m_info, quality, TRUE);
        jpeg_start_compress(&m_info, TRUE);
        while (m_info.next_scanline < m_info.image_height) {
            auto* row = const_cast<JSAMPROW>(picture.samples.data()) +
                        size_t{m_info.next_scanline} * static_cast<size_t>(picture.width) *
                            static_cast<size_t>(picture.channels);
            jpeg_write_scanlines(&m_info, &row, 1);
        }
        jpeg_finish_compress(&m_info);
        return true;
    }

private:
    jpeg_compress_struct m_info = {};
    SErrors m_errors = {};
    unsigned char* m_bytes = nullptr;
    unsigned long m_size = 0;
};

class CDecoder {
public:
    CDecoder() {
        m_errors.attach(m_info);
        jpeg_create_decompress(&m_info);
        m_progress.progress_monitor = [](j_common_ptr info) {
            if (reinterpret_cast<j_decompress_ptr>(info)->input_scan_number > kMaximalScans)
                info->err->error_exit(info);
        };
        m_info.progress = &m_progress;
    }
    ~CDecoder() { jpeg_destroy_decompress(&m_info); }
    CDecoder(const CDecoder&) = delete;
    CDecoder& operator=(const CDecoder&) = delete;

    // The samples have room for the picture. False after an error. No local variable may need a destructor.
    bool decode(std::string_view bytes, SSamples& picture) {
        if (setjmp(m_errors.jump)) return false;
        jpeg_mem_src(&m_info, reinterpret_cast<const unsigned char*>(bytes.data()),
                     static_cast<unsigned long>(bytes.size()));
        jpeg_read_header(&m_info, TRUE);
        if (m_info.image_width != static_cast<JDIMENSION>(picture.width) ||
            m_info.image_height != static_cast<JDIMENSION>(picture.height))
            return false;
        m_info.out_color_space = picture.channels == 1 ? JCS_GRAYSCALE : JCS_RGB;
        jpeg_start_decompress(&m_info);
        while (m_info.output_scanline < m_info.output_height) {
            JSAMPROW row = picture.samples.data() + size_t{m_info.output_scanline} *
                                                        static_cast<size_t>(picture.width) *
                                                        static_cast<size_t>(picture.channels);
            jpeg_read_scanlines(&m_info, &row, 1);
        }
        jpeg_finish_decompress(&m_info);
        return true;
    }

private:
    jpeg_decompress_struct m_info = {};
    SErrors m_errors = {};
    jpeg_progress_mgr m_progress = {};
};

} // namespace

std::string encodeJpeg(const SSamples& picture, int quality) {
    CEncoder encoder;
    if (!encoder.encode(picture, quality))
        throw peru::CError(peru::localize("graphics.WxImages.NotWritten",
                                          "The picture could not be written as %FORMAT%.",
                                          {{"%FORMAT%", "jpg"}}));
    return std::string(encoder.getBytes());
}

SSamples decodeJpeg(std::string_view bytes, int width, int height, int channels) {
    SSamples picture{width, height, channels, {}};
    picture.samples.resize(static_cast<size_t>(width) * static_cast<size_t>(height) *
                           static_cast<size_t>(channels));
    CDecoder decoder;
    if (!decoder.decode(bytes, picture)) failDamaged("jpg");
    return picture;
}

} // namespace wxjng
