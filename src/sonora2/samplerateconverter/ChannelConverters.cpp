#include "sonora2/samplerateconverter/ChannelConverters.h"

#include <cstddef>

namespace sonora2::samplerateconverter {

namespace {

using CChannelConverter = CSampleRateConverter::CChannelConverter;
using SourcePointers = CChannelConverter::SourcePointers;
using PlanePointers = CChannelConverter::PlanePointers;

constexpr unsigned allPlanes(int count) {
    return (1u << count) - 1;
}

// The loops of all matrices. A mix maps the channels of one frame to the sample of one plane, in 32 bits; it
// is stored in 16 bits without clipping. Divisions truncate towards zero.
template <int SRC, int DST, unsigned WRITTEN = allPlanes(DST)> class TShape : public CChannelConverter {
public:
    TShape() : CChannelConverter(SRC, DST, WRITTEN) {}

protected:
    // One pass per plane: with a constant stride and a target without aliases the compiler vectorises the
    // loop, and from the second pass on the source is in the cache.
    template <class Mix> static void mixPlane(int frames, const SourcePointers& source, int stride,
                                              int16_t* __restrict plane, Mix mix) {
        if (isDense(source, stride)) {
            const int16_t* __restrict frame = source[0];
            for (int i = 0; i < frames; ++i) plane[i] = static_cast<int16_t>(mix(frame + i * SRC));
            return;
        }
        for (int i = 0; i < frames; ++i) {
            int16_t frame[SRC];
            for (int c = 0; c < SRC; ++c)
                frame[c] = *reinterpret_cast<const int16_t*>(reinterpret_cast<const char*>(source[c]) +
                                                             static_cast<ptrdiff_t>(i) * stride);
            plane[i] = static_cast<int16_t>(mix(frame));
        }
    }

    template <int CHANNEL>
    static void copyPlane(int frames, const SourcePointers& source, int stride, int16_t* plane) {
        mixPlane(frames, source, stride, plane, [](const int16_t* c) { return int{c[CHANNEL]}; });
    }

private:
    static bool isDense(const SourcePointers& source, int stride) {
        if (stride != SRC * static_cast<int>(sizeof(int16_t))) return false;
        for (int c = 1; c < SRC; ++c)
            if (source[c] != source[0] + c) return false;
        return true;
    }
};

// The gaps of some rows (planes without signal, unused channels) are part of the sound and must stay.

class CMonoToMonoConverter final : public TShape<1, 1> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
    }
};

class CMonoToStereoConverter final : public TShape<1, 2> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<0>(frames, c, stride, d[1]);
    }
};

class CMonoTo3ChannelConverter final : public TShape<1, 3, 0b100> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[2]);
    }
};

class CMonoTo6ChannelConverter final : public TShape<1, 6, 0b100> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[2]);
    }
};

class CStereoToMonoConverter final : public TShape<2, 1> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0], [](const int16_t* s) { return (s[0] + s[1]) / 2; });
    }
};

class CStereoToStereoConverter final : public TShape<2, 2> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<1>(frames, c, stride, d[1]);
    }
};

class CStereoTo3ChannelConverter final : public TShape<2, 3> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<1>(frames, c, stride, d[1]);
        mixPlane(frames, c, stride, d[2], [](const int16_t* s) { return (s[1] * 6) / 8; });
    }
};

class CStereoTo6ChannelConverter final : public TShape<2, 6, 0b011111> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<1>(frames, c, stride, d[1]);
        mixPlane(frames, c, stride, d[2], [](const int16_t* s) { return (s[1] * 6) / 8; });
        mixPlane(frames, c, stride, d[3], [](const int16_t* s) { return s[0] / 2; });
        mixPlane(frames, c, stride, d[4], [](const int16_t* s) { return s[1] / 2; });
    }
};

class C3ChannelToMonoConverter final : public TShape<3, 1> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0], [](const int16_t* s) { return (s[0] + s[1] + 2 * s[2]) / 4; });
    }
};

class C3ChannelToStereoConverter final : public TShape<3, 2> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0], [](const int16_t* s) { return (3 * s[0] + 2 * s[2]) / 5; });
        mixPlane(frames, c, stride, d[1], [](const int16_t* s) { return (3 * s[1] + 2 * s[2]) / 5; });
    }
};

class C3ChannelTo3ChannelConverter final : public TShape<3, 3> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<1>(frames, c, stride, d[1]);
        copyPlane<2>(frames, c, stride, d[2]);
    }
};

class C3ChannelTo6ChannelConverter final : public TShape<3, 6, 0b011111> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<1>(frames, c, stride, d[1]);
        copyPlane<2>(frames, c, stride, d[2]);
        mixPlane(frames, c, stride, d[3], [](const int16_t* s) { return s[0] / 2; });
        mixPlane(frames, c, stride, d[4], [](const int16_t* s) { return s[1] / 2; });
    }
};

class C4ChannelToStereoConverter final : public TShape<4, 2> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0], [](const int16_t* s) { return (4 * s[0] + s[2]) * 2 / 10; });
        mixPlane(frames, c, stride, d[1], [](const int16_t* s) { return (4 * s[1] + s[3]) * 2 / 10; });
    }
};

class C6ChannelToMonoConverter final : public TShape<6, 1> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0],
                 [](const int16_t* s) { return (2 * (s[0] + s[1] + 2 * s[2]) + s[3] + s[4]) / 10; });
    }
};

class C6ChannelToStereoConverter final : public TShape<6, 2> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0], [](const int16_t* s) { return (6 * s[0] + 4 * s[2]) / 10; });
        mixPlane(frames, c, stride, d[1], [](const int16_t* s) { return (6 * s[1] + 4 * s[2]) / 10; });
    }
};

class C6ChannelTo3ChannelConverter final : public TShape<6, 3> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        mixPlane(frames, c, stride, d[0], [](const int16_t* s) { return (4 * s[0] + s[4]) / 5; });
        mixPlane(frames, c, stride, d[1], [](const int16_t* s) { return (4 * s[1] + s[5]) / 5; });
        copyPlane<2>(frames, c, stride, d[2]);
    }
};

class C6ChannelTo6ChannelConverter final : public TShape<6, 6> {
public:
    void convert(int frames, SourcePointers c, int stride, PlanePointers d) const override {
        copyPlane<0>(frames, c, stride, d[0]);
        copyPlane<1>(frames, c, stride, d[1]);
        for (int plane = 2; plane < 6; ++plane) copyPlane<2>(frames, c, stride, d[plane]);
    }
};

struct SRow {
    int sourceChannels;
    int destinationChannels;
    P<CChannelConverter> (*create)();
};

template <class Converter> P<CChannelConverter> createConverter() {
    return peru::make<Converter>();
}

constexpr SRow kTable[] = {
    {1, 1, createConverter<CMonoToMonoConverter>},
    {1, 2, createConverter<CMonoToStereoConverter>},
    {1, 3, createConverter<CMonoTo3ChannelConverter>},
    {1, 6, createConverter<CMonoTo6ChannelConverter>},
    {2, 1, createConverter<CStereoToMonoConverter>},
    {2, 2, createConverter<CStereoToStereoConverter>},
    {2, 3, createConverter<CStereoTo3ChannelConverter>},
    {2, 6, createConverter<CStereoTo6ChannelConverter>},
    {3, 1, createConverter<C3ChannelToMonoConverter>},
    {3, 2, createConverter<C3ChannelToStereoConverter>},
    {3, 3, createConverter<C3ChannelTo3ChannelConverter>},
    {3, 6, createConverter<C3ChannelTo6ChannelConverter>},
    {4, 2, createConverter<C4ChannelToStereoConverter>},
    {6, 1, createConverter<C6ChannelToMonoConverter>},
    {6, 2, createConverter<C6ChannelToStereoConverter>},
    {6, 3, createConverter<C6ChannelTo3ChannelConverter>},
    {6, 6, createConverter<C6ChannelTo6ChannelConverter>},
};

const SRow* findRow(int sourceChannels, int destinationChannels) {
    for (const SRow& row : kTable)
        if (row.sourceChannels == sourceChannels && row.destinationChannels == destinationChannels)
            return &row;
    return nullptr;
}

} // namespace

P<CChannelConverter> CSampleRateConverter::CChannelConverter::create(int sourceChannels,
                                                                     int destinationChannels) {
    const SRow* row = findRow(sourceChannels, destinationChannels);
    return row ? row->create() : nullptr;
}

bool CSampleRateConverter::CChannelConverter::exists(int sourceChannels, int destinationChannels) {
    return findRow(sourceChannels, destinationChannels) != nullptr;
}

} // namespace sonora2::samplerateconverter
