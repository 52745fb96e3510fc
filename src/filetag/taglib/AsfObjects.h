// The order of the objects in the header of an ASF file.
#pragma once

#include <tiostream.h>

namespace filetag::taglib {

// The first value of an attribute is stored in one object and the others in further ones, and TagLib returns
// the values in the order of these objects. Moves the objects, if necessary, so that this is the order of the
// values for every reader. Leaves other content alone. Ends at the start of the stream.
void orderAsfObjects(TagLib::IOStream& stream);

} // namespace filetag::taglib
