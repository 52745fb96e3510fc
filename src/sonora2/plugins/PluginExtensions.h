// A list of file extensions.
#pragma once

#include "peru/ISerializable.h"
#include "sonora2/plugins/ISonoraPlugin.h"

#include <vector>

namespace sonora2::common {

// Ordered, without duplicates. Filled by one thread before any others read it.
class SONORA2_API CPluginExtensions : public peru::CObject,
                                      public IPluginExtensions,
                                      public virtual peru::ISerializable {
public:
    CPluginExtensions();
    ~CPluginExtensions() override;

    int getCount() const override { return static_cast<int>(m_extensions.size()); }
    // Throws CInvalidArgError for an index out of range.
    P<peru::IString> getExtension(int index) const override;

    // False if an equal text is already present.
    bool addExtension(const P<peru::IString>& extension);

    // The count as int32, then the texts. Reading replaces the content.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    std::vector<P<peru::IString>> m_extensions;
};

// The extension that plug-ins are chosen by: lower case, without the dot, and without `suffix`, the ending of
// names of files still being written. Empty if the name has none.
SONORA2_API P<peru::IString> getLookupKey(const P<peru::IURI>& uri, const P<peru::IString>& suffix);

} // namespace sonora2::common
