#include "zvr_lang_manager/LanguageData.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cstring>

namespace zvr_lang {

using peru::P;

void throwDamaged() {
    throw peru::CParseError(
        peru::localize("zvr_lang.CLanguageFile.damaged", "The language file is damaged or incomplete."));
}

CLanguageData::CLanguageData(chf::CChunkStream& chunk, int64_t fileSize) {
    const int64_t size = chunk.GetSize();
    if (size < 0 || size > fileSize - chunk.GetBase() || size > INT32_MAX) throwDamaged();
    m_bytes.resize(static_cast<size_t>(size));
    chunk.Seek(0);
    if (chunk.Read(m_bytes.data(), static_cast<uint32_t>(size)) != m_bytes.size()) throwDamaged();
}

const char* CLanguageData::take(size_t size) {
    if (size > m_bytes.size() - m_position) throwDamaged();
    const char* data = m_bytes.data() + m_position;
    m_position += size;
    return data;
}

uint32_t CLanguageData::readInt() {
    uint32_t value = 0;
    std::memcpy(&value, take(sizeof value), sizeof value);
    return value;
}

uint32_t CLanguageData::readCount(size_t minimumSize) {
    const uint32_t count = readInt();
    if (count > (m_bytes.size() - m_position) / minimumSize) throwDamaged();
    return count;
}

P<peru::IString> CLanguageData::readString() {
    const uint32_t count = readCount(sizeof(char16_t));
    std::u16string units(count, u'\0');
    std::memcpy(units.data(), take(count * sizeof(char16_t)), count * sizeof(char16_t));
    units.resize(std::min(units.find(u'\0'), units.size()));
    if (units.empty()) return peru::CString::empty();
    return peru::CString::fromUTF16(units.data(), static_cast<int32_t>(units.size()))->toUTF8String();
}

} // namespace zvr_lang
