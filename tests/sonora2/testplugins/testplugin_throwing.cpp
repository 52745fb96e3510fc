// Its entry point throws an exception whose code and text are in the library, which is then unloaded.
#include "peru/Errors.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ISonoraPlugin.h"

namespace {

class COwnError : public peru::CError {
public:
    COwnError() : peru::CError("never mind") {}
    peru::P<peru::IString> getDescription() const override {
        return peru::make<peru::CUTF8String>("no licence", -1, peru::EStringStorage::refer);
    }
};

} // namespace

extern "C" SONORA2_API void sonora2_pluginCreate(const peru::P<sonora2::common::ISonoraContext>&,
                                                 peru::P<sonora2::common::ISonoraPlugin>&) {
    throw COwnError();
}
