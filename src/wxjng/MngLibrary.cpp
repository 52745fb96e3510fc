#include "wxjng/MngLibrary.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cstdlib>
#include <new>

namespace wxjng {

namespace {

thread_local int64_t* s_room = nullptr; // of the handle in use

mng_ptr MNG_DECL allocate(mng_size_t size) {
    if (static_cast<int64_t>(size) > *s_room) return nullptr;
    *s_room -= static_cast<int64_t>(size);
    return std::calloc(1, size); // the library expects zeros
}

void MNG_DECL release(mng_ptr memory, mng_size_t size) {
    if (memory) *s_room += static_cast<int64_t>(size);
    std::free(memory);
}

mng_bool MNG_DECL accept(mng_handle) {
    return MNG_TRUE;
}

} // namespace

CMngHandle::CMngHandle(void* user, int64_t maximalBytes) : m_room(maximalBytes) {
    s_room = &m_room;
    m_handle = mng_initialize(user, allocate, release, nullptr);
    if (!m_handle) throw std::bad_alloc();
    // Without these two the library fails, or calls them all the same.
    mng_setcb_openstream(m_handle, accept);
    mng_setcb_closestream(m_handle, accept);
}

CMngHandle::~CMngHandle() {
    s_room = &m_room;
    mng_cleanup(&m_handle);
}

mng_handle CMngHandle::use() {
    s_room = &m_room;
    return m_handle;
}

CMngWriter::CMngWriter() : m_handle(this, INT64_MAX) {
    mng_setcb_writedata(getHandle(), [](mng_handle handle, mng_ptr data, mng_uint32 size,
                                        mng_uint32p written) {
        static_cast<CMngWriter*>(mng_get_userdata(handle))->m_bytes.append(static_cast<char*>(data), size);
        *written = size;
        return mng_bool{MNG_TRUE};
    });
    put(mng_create(getHandle()));
}

void CMngWriter::put(mng_retcode result) const {
    if (result != MNG_NOERROR)
        throw peru::CError(peru::localize("graphics.WxImages.NotWritten",
                                          "The picture could not be written as %FORMAT%.",
                                          {{"%FORMAT%", "mng"}}));
}

std::string CMngWriter::write() {
    put(mng_write(getHandle()));
    return std::move(m_bytes);
}

} // namespace wxjng
