// Parsing and printing a document of 10 MB compared with the bare parser in the same run.
#include "peru/streams/MemoryIOStream.h"
#include "peru/streams/StringStreams.h"
#include "peru/uri/IURI.h"
#include "peru/xml/XmlDocument.h"

#include <benchmark/benchmark.h>
#include <tinyxml.h>

#include <string>

using namespace peru;

namespace {

const std::string& getBytes() {
    static const std::string bytes = [] {
        std::string text = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<Edit>\n    <Tracks>\n";
        while (text.size() < 10'000'000)
            text += "        <Track kind=\"audio\">\n            <TrackStart>12.5</TrackStart>\n"
                    "            <Uri>file:///music/one%20two/three.flac</Uri>\n        </Track>\n";
        return text + "    </Tracks>\n</Edit>\n";
    }();
    return bytes;
}

void setSpeed(benchmark::State& state) {
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(getBytes().size()));
}

void BM_XmlParse_peru(benchmark::State& state) {
    const P<IString> text = CString::fromUTF8(getBytes());
    for (auto _ : state) {
        auto document = make<CXmlDocument>();
        document->parse(make<CStringInStream>(text));
        benchmark::DoNotOptimize(document->getRootNode());
    }
    setSpeed(state);
}

void BM_XmlParse_tinyxml(benchmark::State& state) {
    for (auto _ : state) {
        TiXmlDocument document;
        document.Parse(getBytes().c_str(), nullptr, TIXML_ENCODING_UTF8);
        benchmark::DoNotOptimize(document.RootElement());
    }
    setSpeed(state);
}

void BM_XmlPrint_peru(benchmark::State& state) {
    auto document = make<CXmlDocument>();
    document->parseString(CString::fromUTF8(getBytes()));
    for (auto _ : state) document->print(make<CMemoryIOStream>());
    setSpeed(state);
}

void BM_XmlPrint_tinyxml(benchmark::State& state) {
    TiXmlDocument document;
    document.Parse(getBytes().c_str(), nullptr, TIXML_ENCODING_UTF8);
    for (auto _ : state) {
        TiXmlPrinter printer;
        document.Accept(&printer);
        benchmark::DoNotOptimize(printer.Size());
    }
    setSpeed(state);
}

BENCHMARK(BM_XmlParse_peru)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_XmlParse_tinyxml)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_XmlPrint_peru)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_XmlPrint_tinyxml)->Unit(benchmark::kMillisecond);

} // namespace
