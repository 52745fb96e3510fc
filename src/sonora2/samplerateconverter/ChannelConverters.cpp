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

// The loops of all matrices. A class describes its mixes to a mixer, once for each sample width. A mix maps
// the channels of one frame to the sample of one plane in the wider type `Sum`, and is stored without
// clipping. Divisions truncate towards zero.
template <class Class, int SRC, int DST, unsigned WRITTEN = allPlanes(DST)> class TShape
    : public CChannelConverter {
public:
    TShape() : CChannelConverter(SRC, DST, WRITTEN) {}

    void convert(int frames, SourcePointers source, int stride, PlanePointers planes) const final {
        Class::describe([&](int plane, auto mix) { mixPlane(frames, source, stride, planes[plane], mix); });
    }
    void convertWide(int frames, const int32_t* source, WidePlanePointers planes) const final {
        Class::describe([&](int plane, auto mix) { mixDense<int64_t>(frames, source, planes[plane], mix); });
    }

private:
    // One pass per plane: with a constant stride and a target without aliases the compiler vectorises the
    // loop, and from the second pass on the source is in the cache.
    template <class Sum, class Sample, class Mix>
    static void mixDense(int frames, const Sample* __restrict frame, Sample* __restrict plane, Mix mix) {
        for (int i = 0; i < frames; ++i)
            plane[i] = static_cast<Sample>(mix(SFrame<Sum, Sample>{frame + i * SRC}));
    }

    template <class Mix> static void mixPlane(int frames, const SourcePointers& source, int stride,
                                              int16_t* __restrict plane, Mix mix) {
        if (isDense(source, stride)) return mixDense<int>(frames, source[0], plane, mix);
        for (int i = 0; i < frames; ++i) {
            int16_t frame[SRC];
            for (int c = 0; c < SRC; ++c)
                frame[c] = *reinterpret_cast<const int16_t*>(reinterpret_cast<const char*>(source[c]) +
                                                             static_cast<ptrdiff_t>(i) * stride);
            plane[i] = static_cast<int16_t>(mix(SFrame<int, int16_t>{frame}));
        }
    }

    template <class Sum, class Sample> struct SFrame {
        const Sample* channels;
        Sum operator[](int channel) const { return channels[channel]; }
    };

    static bool isDense(const SourcePointers& source, int stride) {
        if (stride != SRC * static_cast<int>(sizeof(int16_t))) return false;
        for (int c = 1; c < SRC; ++c)
            if (source[c] != source[0] + c) return false;
        return true;
    }
};

template <int CHANNEL> constexpr auto kCopy = [](auto s) { return s[CHANNEL]; };

// The gaps of some rows (planes without signal, unused channels) are part of the sound and must stay.

class CMonoToMonoConverter final : public TShape<CMonoToMonoConverter, 1, 1> {
public:
    template <class Mixer> static void describe(Mixer mixer) { mixer(0, kCopy<0>); }
};

class CMonoToStereoConverter final : public TShape<CMonoToStereoConverter, 1, 2> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<0>);
    }
};

class CMonoTo3ChannelConverter final : public TShape<CMonoTo3ChannelConverter, 1, 3, 0b100> {
public:
    template <class Mixer> static void describe(Mixer mixer) { mixer(2, kCopy<0>); }
};

class CMonoTo6ChannelConverter final : public TShape<CMonoTo6ChannelConverter, 1, 6, 0b100> {
public:
    template <class Mixer> static void describe(Mixer mixer) { mixer(2, kCopy<0>); }
};

class CStereoToMonoConverter final : public TShape<CStereoToMonoConverter, 2, 1> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (s[0] + s[1]) / 2; });
    }
};

class CStereoToStereoConverter final : public TShape<CStereoToStereoConverter, 2, 2> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<1>);
    }
};

class CStereoTo3ChannelConverter final : public TShape<CStereoTo3ChannelConverter, 2, 3> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<1>);
        mixer(2, [](auto s) { return (s[1] * 6) / 8; });
    }
};

class CStereoTo6ChannelConverter final : public TShape<CStereoTo6ChannelConverter, 2, 6, 0b011111> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<1>);
        mixer(2, [](auto s) { return (s[1] * 6) / 8; });
        mixer(3, [](auto s) { return s[0] / 2; });
        mixer(4, [](auto s) { return s[1] / 2; });
    }
};

class C3ChannelToMonoConverter final : public TShape<C3ChannelToMonoConverter, 3, 1> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (s[0] + s[1] + 2 * s[2]) / 4; });
    }
};

class C3ChannelToStereoConverter final : public TShape<C3ChannelToStereoConverter, 3, 2> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (3 * s[0] + 2 * s[2]) / 5; });
        mixer(1, [](auto s) { return (3 * s[1] + 2 * s[2]) / 5; });
    }
};

class C3ChannelTo3ChannelConverter final : public TShape<C3ChannelTo3ChannelConverter, 3, 3> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<1>);
        mixer(2, kCopy<2>);
    }
};

class C3ChannelTo6ChannelConverter final : public TShape<C3ChannelTo6ChannelConverter, 3, 6, 0b011111> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<1>);
        mixer(2, kCopy<2>);
        mixer(3, [](auto s) { return s[0] / 2; });
        mixer(4, [](auto s) { return s[1] / 2; });
    }
};

class C4ChannelToStereoConverter final : public TShape<C4ChannelToStereoConverter, 4, 2> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (4 * s[0] + s[2]) * 2 / 10; });
        mixer(1, [](auto s) { return (4 * s[1] + s[3]) * 2 / 10; });
    }
};

class C6ChannelToMonoConverter final : public TShape<C6ChannelToMonoConverter, 6, 1> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (2 * (s[0] + s[1] + 2 * s[2]) + s[3] + s[4]) / 10; });
    }
};

class C6ChannelToStereoConverter final : public TShape<C6ChannelToStereoConverter, 6, 2> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (6 * s[0] + 4 * s[2]) / 10; });
        mixer(1, [](auto s) { return (6 * s[1] + 4 * s[2]) / 10; });
    }
};

class C6ChannelTo3ChannelConverter final : public TShape<C6ChannelTo3ChannelConverter, 6, 3> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, [](auto s) { return (4 * s[0] + s[4]) / 5; });
        mixer(1, [](auto s) { return (4 * s[1] + s[5]) / 5; });
        mixer(2, kCopy<2>);
    }
};

class C6ChannelTo6ChannelConverter final : public TShape<C6ChannelTo6ChannelConverter, 6, 6> {
public:
    template <class Mixer> static void describe(Mixer mixer) {
        mixer(0, kCopy<0>);
        mixer(1, kCopy<1>);
        for (int plane = 2; plane < 6; ++plane) mixer(plane, kCopy<2>);
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
