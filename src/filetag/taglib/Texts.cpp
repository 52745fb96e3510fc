#include "filetag/taglib/Texts.h"

#include <cstring>
#include <string>

namespace filetag::taglib {

TagLib::String toTagText(const peru::CStringArg& text) {
    const std::u16string units = peru::CString::toStdU16String(text);
    return TagLib::String(std::wstring(units.begin(), units.end()));
}

P<peru::IString> fromTagText(const TagLib::String& text) {
    if (text.isEmpty()) return peru::CString::empty();
    std::u16string units;
    units.reserve(text.size());
    for (const wchar_t unit : text) units.push_back(static_cast<char16_t>(unit));
    return peru::CString::fromUTF16(units.data(), static_cast<int32_t>(units.size()));
}

TagLib::ByteVector toTagBytes(const P<peru::CMemoryBlock>& block) {
    if (!block) return {};
    return TagLib::ByteVector(reinterpret_cast<const char*>(block->getData()),
                              static_cast<unsigned int>(block->getSize()));
}

P<peru::CMemoryBlock> fromTagBytes(const TagLib::ByteVector& bytes) {
    const P<peru::CMemoryBlock> block = peru::make<peru::CMemoryBlock>(bytes.size());
    if (!bytes.isEmpty()) std::memcpy(block->getData(), bytes.data(), bytes.size());
    return block;
}

} // namespace filetag::taglib
