// Treats arbitrary bytes as a disc image whose only other file is itself, by the name "x": every block of a
// track that is accepted can be read.
#include "images/ImageLayout.h"

#include <cstdlib>
#include <fstream>

using namespace discio;

namespace {

const std::string& getPath() {
    static const std::string s_path = [] {
        std::string folder = "/tmp/tonewright-fuzz-XXXXXX";
        if (!::mkdtemp(folder.data())) std::abort();
        return folder + "/x";
    }();
    return s_path;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::ofstream(getPath(), std::ios::binary)
        .write(reinterpret_cast<const char*>(data), static_cast<long>(size));
    try {
        const SImageLayout layout = READ_IMAGE(getPath());
        checkLayout(layout, getPath());
        for (const SExtent& extent : layout.extents) {
            if (extent.form == ESectorForm::silence) continue;
            const CImageFile& file = *layout.files.at(static_cast<size_t>(extent.file));
            const int64_t behind = extent.offset + extent.bytes;
            if (extent.offset < 0 || extent.bytes < 0 || behind > file.getSize()) std::abort();
            if (extent.bytes > int64_t{extent.count} * getSectorBytes(extent.form)) std::abort();
        }
    } catch (const CDiscError&) {
    }
    return 0;
}
