// The content of a file on a data disc as a stream.
#pragma once

#include "disciopp/IDisc.h"
#include "peru/streams/IStreams.h"
#include "peru/uri/IURI.h"

namespace disciopp {

// Opens the file that a URI names: "discioppdiscimage:///folder/disc.iso/Folder/file.txt" in an image, or
// "file:///dev/sr0/Folder/file.txt" in a drive. Empty if there is no such file, or the URI names something
// else. Throws CDISCIOPPException if the disc or image cannot be read.
DISCIOPP_API P<peru::ISeekableInStream> tryOpenFile(const P<peru::IURI>& uri);

} // namespace disciopp
