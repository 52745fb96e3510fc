// Files with many large pictures.
#include "Designs.h"
#include "graphics/images/ImageCodec.h"
#include "graphics/storage/DocumentArchive.h"

#include <benchmark/benchmark.h>

using namespace graphics;

namespace {

constexpr int kImages = 100;
constexpr SPixelSize kSize{3872, 2592}; // 10 megapixels

const std::string& getArchive() {
    static const std::string archive = [] {
        std::vector<uint32_t> pixels(static_cast<size_t>(kSize.width) * static_cast<size_t>(kSize.height));
        // Some noise, so that the files have the size of photographs.
        for (size_t i = 0; i < pixels.size(); ++i)
            pixels[i] = 0xFF000000u | static_cast<uint32_t>(i % static_cast<size_t>(kSize.width) / 16) |
                        (static_cast<uint32_t>(i) * 2654435761u >> 28) << 10;
        const std::string jpeg =
            peru::make<CBitmap>(kSize.width, kSize.height, std::move(pixels))->Encode(EBitmapFormat::jpg);
        auto document = peru::make<CGraphicDocument>();
        for (int i = 0; i < kImages; ++i) {
            const auto image = peru::make<CGraphicImage>();
            // A bitmap of its own, so that the archive has as many entries.
            image->SetBitmap(peru::make<CBitmap>(EBitmapFormat::jpg, jpeg));
            image->SetSize(100, 70);
            document->Add(image);
        }
        return WriteArchive(kProjectForm, [&](const P<peru::IXmlNode>& root, IResourceOutputStore& store) {
            document->Save(root->addChildNode("graphic-document"), store);
        });
    }();
    return archive;
}

// Nothing is decoded before it is painted.
void BM_OpenManyImages(benchmark::State& state) {
    const std::string& archive = getArchive();
    for (auto _ : state) {
        auto document = peru::make<CGraphicDocument>();
        ReadArchive(kProjectForm, archive, [&](const P<peru::IXmlNode>& root, IResourceInputStore& store) {
            document->Load(root->getChildNode("graphic-document"), store);
        });
        if (document->GetCount() != kImages) std::abort();
        benchmark::DoNotOptimize(document.get());
    }
    state.SetLabel(std::to_string(archive.size() / 1'000'000) + " MB");
}
BENCHMARK(BM_OpenManyImages)->Unit(benchmark::kMillisecond);

} // namespace
