// Streams of the files on discs and in disc images.
#pragma once

#include "peru/streams/StreamFactory.h"

namespace tonewright {

// Loads the disc library for the first URI of a disc image. Drives are asked only if the library is loaded
// already: until then, a file that does not exist must not cost a search for drives.
class CDiscStreamFactory : public peru::CStreamFactory {
public:
    CDiscStreamFactory() = default;

    void reportMissing(const peru::P<peru::IURI>& uri) const override;
    peru::P<peru::ISeekableInStream> tryGetSeekableInStream(const peru::P<peru::IURI>& uri) override;

private:
    ~CDiscStreamFactory() override = default;
    template <class T, class... Args> friend peru::P<T> peru::make(Args&&... args);
};

} // namespace tonewright
