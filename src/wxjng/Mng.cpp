#include "wxjng/Mng.h"

#include "peru/Errors.h"
#include "peru/gui/ImageLimits.h"
#include "wxjng/Chunks.h"
#include "wxjng/MngLibrary.h"
#include "wxjng/MngStream.h"
#include "wxjng/PngSamples.h"

#include <cstring>
#include <utility>
#include <wx/image.h>

namespace wxjng {

namespace {

constexpr uint32_t kForever = 0x7FFFFFFF;

// Pictures of the animation, the largest of which have 16 bits for each of four channels, and their rows.
int64_t getMemoryLimit(const SMngStream& stream) {
    return 2 * 8 * peru::gui::getMaximalPixels() + (16 << 20) + static_cast<int64_t>(stream.bytes.size());
}

} // namespace

class CMngReader::CImpl {
public:
    explicit CImpl(std::string_view bytes)
        : m_stream(prepareMng(bytes)), m_image(m_stream.width, m_stream.height),
          m_next(m_stream.width, m_stream.height), m_spareRow(static_cast<size_t>(m_stream.width)),
          m_handle(this, getMemoryLimit(m_stream)) {
        const mng_handle handle = m_handle.use();
        mng_setcb_readdata(handle, read);
        mng_setcb_processheader(handle, start);
        mng_setcb_getcanvasline(handle, getRow);
        mng_setcb_refresh(handle, refresh);
        mng_setcb_gettickcount(handle, getTime);
        mng_setcb_settimer(handle, setTimer);
        mng_setcb_errorproc(handle, [](mng_handle, mng_int32, mng_int8, mng_chunkid, mng_uint32, mng_int32,
                                       mng_int32, mng_pchar) { return mng_bool{MNG_FALSE}; });
        mng_set_doprogressive(handle, MNG_FALSE);
        mng_set_cacheplayback(handle, MNG_FALSE);
    }

    const SMngStream& getStream() const { return m_stream; }
    const peru::gui::CRGBAImage& getImage() const { return m_image; }
    int getDuration() const { return m_duration; }

    // The library paints into the next image and waits, for some frames several times. A frame is complete
    // when the library paints again.
    bool next() {
        while (!m_hasPainted && !m_isFinished) proceed(); // for the first frame only
        if (!std::exchange(m_hasPainted, false)) return false;
        m_image = m_next;
        m_duration = m_timer;
        while (!m_hasPainted && !m_isFinished) {
            proceed();
            if (!m_hasPainted) m_duration += m_timer;
        }
        if (m_hasPainted && m_isBehindEnd) { // this is the invisible picture
            m_hasPainted = false;
            m_isFinished = true;
        }
        return true;
    }

private:
    static CImpl& get(mng_handle handle) { return *static_cast<CImpl*>(mng_get_userdata(handle)); }

    static mng_bool MNG_DECL read(mng_handle handle, mng_ptr buffer, mng_uint32 size, mng_uint32p count) {
        CImpl& self = get(handle);
        *count =
            static_cast<mng_uint32>(std::min<size_t>(size, self.m_stream.bytes.size() - self.m_position));
        std::memcpy(buffer, self.m_stream.bytes.data() + self.m_position, *count);
        self.m_position += *count;
        return MNG_TRUE;
    }

    static mng_bool MNG_DECL start(mng_handle handle, mng_uint32 width, mng_uint32 height) {
        // Words of 0xAARRGGBB.
        mng_set_canvasstyle(handle, MNG_CANVAS_BGRA8);
        const SMngStream& stream = get(handle).m_stream;
        return width == static_cast<mng_uint32>(stream.width) &&
               height == static_cast<mng_uint32>(stream.height);
    }

    // The library asks for rows below the picture as well.
    static mng_ptr MNG_DECL getRow(mng_handle handle, mng_uint32 row) {
        CImpl& self = get(handle);
        return row < static_cast<mng_uint32>(self.m_stream.height) ? self.m_next.getRow(static_cast<int>(row))
                                                                   : self.m_spareRow.data();
    }

    static mng_bool MNG_DECL refresh(mng_handle handle, mng_uint32, mng_uint32, mng_uint32, mng_uint32) {
        get(handle).m_hasPainted = true;
        return MNG_TRUE;
    }

    static mng_uint32 MNG_DECL getTime(mng_handle handle) { return get(handle).m_time; }

    static mng_bool MNG_DECL setTimer(mng_handle handle, mng_uint32 milliseconds) {
        get(handle).m_timer = static_cast<int>(std::min(milliseconds, mng_uint32{1} << 24));
        return MNG_TRUE;
    }

    // Runs the library up to its next wait or to the end.
    void proceed() {
        m_isBehindEnd = m_position > m_stream.end;
        m_timer = 0;
        const mng_handle handle = m_handle.use();
        const mng_retcode result =
            std::exchange(m_hasStarted, true) ? mng_display_resume(handle) : mng_readdisplay(handle);
        if (result != MNG_NEEDTIMERWAIT) m_isFinished = true;
        if (result != MNG_NEEDTIMERWAIT && result != MNG_NOERROR) failDamaged("mng");
        m_time += static_cast<mng_uint32>(m_timer);
        // The library waits for a millisecond at the end of the file, which no frame asks for.
        if (m_position == m_stream.bytes.size() && m_timer == 1) m_timer = 0;
    }

    const SMngStream m_stream;
    peru::gui::CRGBAImage m_image; // the current frame
    peru::gui::CRGBAImage m_next;  // what the library paints on
    std::vector<uint32_t> m_spareRow;
    size_t m_position = 0;
    bool m_hasStarted = false;
    bool m_isFinished = false;
    bool m_hasPainted = false;  // during the last call of the library
    bool m_isBehindEnd = false; // before the last call of the library
    mng_uint32 m_time = 0;      // a clock that advances as the library waits
    int m_timer = 0;
    int m_duration = 0;
    CMngHandle m_handle;
};

CMngReader::CMngReader(std::string_view bytes) : m_impl(std::make_unique<CImpl>(bytes)) {}

CMngReader::~CMngReader() = default;

int CMngReader::getWidth() const {
    return m_impl->getStream().width;
}

int CMngReader::getHeight() const {
    return m_impl->getStream().height;
}

int CMngReader::getLoops() const {
    return m_impl->getStream().loops;
}

bool CMngReader::next() {
    return m_impl->next();
}

const peru::gui::CRGBAImage& CMngReader::getImage() const {
    return m_impl->getImage();
}

int CMngReader::getDuration() const {
    return m_impl->getDuration();
}

std::string encodeMng(const std::vector<SMngFrame>& frames, int loops) {
    if (frames.empty()) throw peru::CInvalidArgError("frames", "encodeMng");
    // Per second. Some readers misread the durations unless there are hundred, as in a GIF file.
    const auto isCoarse = [](const SMngFrame& frame) { return frame.milliseconds % 10 == 0; };
    const mng_uint32 ticks = std::all_of(frames.begin(), frames.end(), isCoarse) ? 100 : 1000;
    const int tick = 1000 / static_cast<int>(ticks);
    constexpr mng_uint8 kEveryLayerIsAFrame = 3, kFromNowOn = 2, kUnchanged = 0, kRepeat = 3;
    const int width = frames.front().image.GetWidth(), height = frames.front().image.GetHeight();
    CMngWriter writer;
    const mng_handle handle = writer.getHandle();
    const auto count = static_cast<mng_uint32>(frames.size());
    writer.put(mng_putchunk_mhdr(handle, static_cast<mng_uint32>(width), static_cast<mng_uint32>(height),
                                 ticks, 0, count, 0, 0));
    if (frames.size() > 1)
        writer.put(
            mng_putchunk_term(handle, kRepeat, 0, 0, loops > 0 ? static_cast<mng_uint32>(loops) : kForever));
    for (const SMngFrame& frame : frames) {
        if (frame.image.GetWidth() != width || frame.image.GetHeight() != height)
            throw peru::CInvalidArgError("frames", "encodeMng");
        if (frames.size() > 1)
            writer.put(mng_putchunk_fram(handle, MNG_FALSE, kEveryLayerIsAFrame, 0, nullptr, kFromNowOn,
                                         kUnchanged, kUnchanged, kUnchanged,
                                         static_cast<mng_uint32>(std::max(frame.milliseconds / tick, 1)), 0,
                                         0, 0, 0, 0, 0, 0, nullptr));
        constexpr mng_uint8 kColour = 2, kColourAlpha = 6;
        const SPngData data = encodeColourIdat(frame.image);
        writer.put(mng_putchunk_ihdr(handle, static_cast<mng_uint32>(width), static_cast<mng_uint32>(height),
                                     8, data.hasAlpha ? kColourAlpha : kColour, 0, 0, 0));
        writer.put(mng_putchunk_idat(handle, static_cast<mng_uint32>(data.idat.size()),
                                     const_cast<char*>(data.idat.data())));
        writer.put(mng_putchunk_iend(handle));
    }
    writer.put(mng_putchunk_mend(handle));
    return writer.write();
}

} // namespace wxjng
