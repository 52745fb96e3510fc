// Documents of many elements.
#include "Designs.h"
#include "graphics/painting/OffScreen.h"
#include "graphics/painting/PaintContext.h"

#include <benchmark/benchmark.h>

using namespace graphics;

namespace {

constexpr int kElements = 10'000; // on a square of 200 mm

// The whole list is searched: nothing lies beside the grid.
void BM_HitTest(benchmark::State& state) {
    const auto document = bench::makeGrid(kElements);
    for (auto _ : state) benchmark::DoNotOptimize(document->FindAt(-10, -10));
}
BENCHMARK(BM_HitTest)->Unit(benchmark::kMicrosecond);

void BM_BoundingBox(benchmark::State& state) {
    const auto document = bench::makeGrid(kElements);
    for (auto _ : state) {
        if (state.range(0)) document->GetElement(0)->SetCenter(1, 1);
        benchmark::DoNotOptimize(document->GetBoundingBox());
    }
    state.SetLabel(state.range(0) ? "after a change" : "unchanged");
}
BENCHMARK(BM_BoundingBox)->Arg(0)->Arg(1)->Unit(benchmark::kMicrosecond);

// A window of the given percentage of the document, at 4 pixels per millimetre.
void BM_PaintVisible(benchmark::State& state) {
    const auto document = bench::makeGrid(kElements);
    const double side = 200 * std::sqrt(static_cast<double>(state.range(0)) / 100);
    const auto pixels = std::max(1L, std::lround(side * 4));
    // Far to the right of the document nothing is visible.
    const CMatrix matrix = CMatrix::scaling(4, 4) * CMatrix::translation(state.range(0) ? 0 : -500, 0);
    COffScreen target(pixels, pixels);
    for (auto _ : state) {
        CPaintContext context(target.GetGraphics(), matrix);
        document->PaintElements(context);
        benchmark::DoNotOptimize(target.GetRow(0));
    }
    state.SetLabel(std::to_string(state.range(0)) + " % visible");
}
BENCHMARK(BM_PaintVisible)->Arg(0)->Arg(1)->Arg(10)->Arg(100)->Unit(benchmark::kMillisecond);

} // namespace
