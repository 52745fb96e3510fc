#include "peru/Object.h"
#include "sonora2/samplerateconverter/IResampler.h"

extern "C" {
#include <libavutil/channel_layout.h>
#include <libavutil/opt.h>
#include <libswresample/swresample.h>
}

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <memory>

namespace sonora2::samplerateconverter {

namespace {

constexpr int kMaxRatio = 1024;
constexpr int kOutputMargin = 64;

struct SContextDeleter {
    void operator()(SwrContext* context) const { swr_free(&context); }
};

using Context = std::unique_ptr<SwrContext, SContextDeleter>;

class CResampler : public peru::CObject, public IResampler {
public:
    CResampler(Context context, int inRate, int outRate, int64_t margin)
        : m_context(std::move(context)), m_inRate(inRate), m_outRate(outRate), m_margin(margin) {}
    int run(void* dst, const void* src, int* consumed, int srcSize, int dstSize) override;

private:
    ~CResampler() override = default;

    Context m_context;
    int64_t m_inRate;
    int64_t m_outRate;
    int64_t m_margin; // output samples that the history may add to what a call's own input gives
};

class CLibrary : public peru::CObject, public IResamplerLibrary {
public:
    P<IResampler> create(int outRate, int inRate, int filterSize, int phaseShift, int linear, double cutoff,
                         int bytesPerSample) override;

private:
    ~CLibrary() override = default;
};

bool isBestWanted() {
    const char* wanted = std::getenv("TONEWRIGHT_RESAMPLER");
    return wanted && std::strcmp(wanted, "best") == 0;
}

Context allocate(int outRate, int inRate, AVSampleFormat format) {
    AVChannelLayout mono = AV_CHANNEL_LAYOUT_MONO;
    SwrContext* made = nullptr;
    if (swr_alloc_set_opts2(&made, &mono, format, outRate, &mono, format, inRate, 0, nullptr) < 0)
        return nullptr;
    Context context(made);
    // The flag makes it filter equal rates too.
    const bool accepted = av_opt_set_sample_fmt(made, "internal_sample_fmt", format, 0) >= 0 &&
                          av_opt_set(made, "flags", "+res", 0) >= 0;
    return accepted ? std::move(context) : nullptr;
}

Context createBest(int outRate, int inRate, AVSampleFormat format) {
    constexpr double kPrecision = 28.0; // bits
    Context context = allocate(outRate, inRate, format);
    const bool accepted = context && av_opt_set(context.get(), "resampler", "soxr", 0) >= 0 &&
                          av_opt_set_double(context.get(), "precision", kPrecision, 0) >= 0 &&
                          swr_init(context.get()) >= 0;
    return accepted ? std::move(context) : nullptr;
}

P<IResampler> CLibrary::create(int outRate, int inRate, int filterSize, int phaseShift, int linear,
                               double cutoff, int bytesPerSample) {
    if (outRate <= 0 || inRate <= 0 || outRate / inRate >= kMaxRatio || inRate / outRate >= kMaxRatio)
        return nullptr;
    const AVSampleFormat format = bytesPerSample == 2 ? AV_SAMPLE_FMT_S16P : AV_SAMPLE_FMT_S32P;
    if (isBestWanted()) {
        if (Context best = createBest(outRate, inRate, format))
            return peru::make<CResampler>(std::move(best), inRate, outRate, int64_t{1} << 20);
    }
    Context context = allocate(outRate, inRate, format);
    if (!context) return nullptr;
    // Every option that affects the sound is set explicitly; the library's defaults differ.
    SwrContext* made = context.get();
    const bool accepted = av_opt_set(made, "resampler", "swr", 0) >= 0 &&
                          av_opt_set_int(made, "filter_size", filterSize, 0) >= 0 &&
                          av_opt_set_int(made, "phase_shift", phaseShift, 0) >= 0 &&
                          av_opt_set_int(made, "linear_interp", linear, 0) >= 0 &&
                          av_opt_set_int(made, "exact_rational", 0, 0) >= 0 &&
                          av_opt_set_double(made, "cutoff", cutoff, 0) >= 0 &&
                          av_opt_set(made, "filter_type", "kaiser", 0) >= 0 &&
                          av_opt_set_double(made, "kaiser_beta", 9.0, 0) >= 0;
    if (!accepted || swr_init(made) < 0) return nullptr;

    // The filter first collects two filter lengths of input and then outputs them at once.
    const int64_t taps = filterSize * ((std::max(inRate, outRate) + int64_t{outRate} - 1) / outRate);
    const int64_t margin = 2 * taps * outRate / inRate + kOutputMargin;
    return peru::make<CResampler>(std::move(context), inRate, outRate, margin);
}

int CResampler::run(void* dst, const void* src, int* consumed, int srcSize, int dstSize) {
    // The library buffers whatever does not fit the output, without bound, so it gets no more input than fits
    // (apart from the initial fill). The output size passed to it stays close to what is expected, since it
    // becomes slow with a large one.
    const int64_t fitting = dstSize * m_inRate / m_outRate;
    const int taken = static_cast<int>(std::min<int64_t>(srcSize, fitting));
    const int64_t expected = taken * m_outRate / m_inRate + m_margin;
    uint8_t* out = static_cast<uint8_t*>(dst);
    const uint8_t* in = static_cast<const uint8_t*>(src);
    const int made = swr_convert(m_context.get(), &out,
                                 static_cast<int>(std::min<int64_t>(dstSize, expected)), &in, taken);
    *consumed = made < 0 ? 0 : taken;
    return made < 0 ? -1 : made;
}

} // namespace

} // namespace sonora2::samplerateconverter

extern "C" SONORA2_API void
sonora2_getResamplerLibrary(peru::P<sonora2::samplerateconverter::IResamplerLibrary>& library) {
    library = peru::make<sonora2::samplerateconverter::CLibrary>();
}
