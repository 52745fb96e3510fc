// Cost of converting a picture to RGB.
#include "sonora2/pictures/NV12Picture.h"
#include "sonora2/pictures/YUY2Picture.h"
#include "sonora2/pictures/YV12Picture.h"

#include <benchmark/benchmark.h>

#include <cstring>

namespace {

using peru::P;

// Full HD; the bytes counted are those of the result.
template <class Picture> void convertToRGB(benchmark::State& state) {
    constexpr int kWidth = 1920, kHeight = 1080;
    const P<peru::IMemoryManager> memory = peru::make<peru::CMemoryManager>();
    const int64_t bytes = Picture::getBlockBytes(kWidth, kHeight);
    const P<peru::IMemoryBlock> block = memory->getBlock(bytes);
    std::memset(block->getData(), 90, static_cast<size_t>(bytes));
    for (auto _ : state) {
        const auto picture = peru::make<Picture>(memory, 0.0, kWidth, kHeight, false, block);
        benchmark::DoNotOptimize(picture->getRGBPicture());
    }
    state.SetBytesProcessed(state.iterations() * kWidth * kHeight * 4);
}
BENCHMARK(convertToRGB<sonora2::common::CYUY2Picture>);
BENCHMARK(convertToRGB<sonora2::common::CNV12Picture>);
BENCHMARK(convertToRGB<sonora2::common::CYV12Picture>);

} // namespace
