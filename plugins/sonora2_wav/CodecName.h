// Codecs that are not supported.
#pragma once

#include <cstdio>
#include <string>

namespace sonora2::plugins::wav {

// The codec that a WAV or CAF file states, such as "IMA ADPCM (ima4)", if it is known not to be supported
// there; otherwise empty. With `any`, every codec is returned, such as "0x0271".
std::string readUnsupportedCodec(std::FILE* file, bool any);

} // namespace sonora2::plugins::wav
