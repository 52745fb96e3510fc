#include "InstallFolders.h"
#include "peru/system/LazyLibrary.h"
#include "sonora2/samplerateconverter/IResampler.h"

namespace sonora2::samplerateconverter {

const P<IResamplerLibrary>& getResamplerLibrary() {
    static constexpr peru::SLazyLibraryPlace kPlace{
        RESAMPLER_SONAME,
        kGetResamplerLibraryName,
        TONEWRIGHT_PLUGIN_FOLDER,
        {"sonora2.ResamplerLibrary.missing", "The resampling library %s is missing"}};
    return peru::TLazyLibrary<IResamplerLibrary>::get(kPlace);
}

} // namespace sonora2::samplerateconverter
