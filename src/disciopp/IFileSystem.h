// The contents of drives and discs as files.
#pragma once

#include "disciopp/Api.h"
#include "peru/files/IFileSystem.h"

namespace disciopp {

class DISCIOPP_API IFileSystem : public virtual peru::IFileSystem {};
class DISCIOPP_API IFileObject : public virtual peru::IFileObject {};
// Is also the object that it stands on.
class DISCIOPP_API IFileObjectCursor : public virtual peru::IFileObjectCursor, public virtual IFileObject {};

} // namespace disciopp
