// Feeds arbitrary bytes to the serial forms that cross the pipe: each must yield an object or throw, and a
// context that could not be read must be unchanged.
#include "peru/Errors.h"
#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/AudioRun.h"
#include "sonora2/boxed/RemoteFacets.h"
#include "sonora2/boxed/RemoteLog.h"
#include "sonora2/boxed/RemoteMediaState.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/pictures/SonoraPictureRemote.h"
#include "sonora2/plugins/PluginExtensions.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>

using namespace peru;
using namespace sonora2;

namespace {

P<IDataInStream> makeStream(const uint8_t* data, size_t size) {
    const P<CMemoryBlock> block = make<CMemoryBlock>(static_cast<int64_t>(size));
    if (size > 0) std::memcpy(block->getData(), data, size);
    return make<CDataInStream>(make<CMemoryIOStream>(block));
}

template <class T> bool read(const P<T>& object, const P<IDataInStream>& stream) {
    try {
        object->readFrom(stream);
        return true;
    } catch (const CException&) {
        return false;
    }
}

class CSilentLog : public CObject, public common::ILogManager {
public:
    void log(int32_t, const P<IString>&) override {}
    void logException(const CException&) override {}
};

// The dimensions need not match the bytes: every use of the pixels must throw or stay within the block.
void readPicture(const P<IDataInStream>& stream) {
    const auto carrier = make<common::CSonoraPictureRemote>(make<CMemoryManager>());
    if (!read(carrier, stream)) return;
    const P<common::ISonoraPicture> picture = carrier->getPicture();
    const int width = picture->getWidth(), height = picture->getHeight();
    try {
        picture->getRGBPicture()->createThumbnail();
        picture->createThumbnail()->getRGBPicture();
        for (int plane = 0; plane < 3; ++plane) {
            picture->getImagePlane(plane, width / 3, height / 3, width / 2, height / 2);
            picture->fillPlaneBlack(plane, width / 2, height / 2, width - width / 2, height - height / 2);
        }
        picture->drawInto(picture, 0, 1, 1, 0, width - 1, height - 1);
        picture->getImagePlane(1, 0, 0, width, height);
    } catch (const CException&) {
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0) return 0;
    const P<IDataInStream> stream = makeStream(data + 1, size - 1);
    switch (data[0] % 10) {
    case 0: {
        const auto context = make<audio::CSonoraContextAudio>();
        if (!read(context, stream) && context->getPluginNameCount() != 0) std::abort();
        break;
    }
    case 1:
        read(make<audio::CAudioStreamInfos>(), stream);
        break;
    case 2:
        read(make<common::CPluginExtensions>(), stream);
        break;
    case 3:
        read(make<audio::CAudioChunk>(0.0, make<CMemoryBlock>()), stream);
        break;
    case 4:
        readPicture(stream);
        break;
    case 5:
        read(make<audio::CAudioRun>(make<CMemoryManager>()), stream);
        break;
    case 6:
        read(make<common::CRemoteMediaState>(), stream);
        break;
    case 7:
        read(make<common::CRemoteMediaDescription>(), stream);
        break;
    case 8:
        read(make<audio::CAudioChunkRemote>(make<CMemoryManager>()), stream);
        break;
    case 9:
        common::replayLog(CString::fromUTF8({reinterpret_cast<const char*>(data + 1), size - 1}),
                          *make<CSilentLog>());
        break;
    }
    return 0;
}
