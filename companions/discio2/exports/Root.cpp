#include "exports/Handles.h"

#include <new>

using namespace discio;

namespace {

struct SLastError {
    int32_t code = DISCIO_ERROR_NONE;
    std::string detail;
};
thread_local SLastError t_lastError;

template <class T> void destroy(void* handle) {
    T* object = static_cast<T*>(handle);
    object->kind = static_cast<uint32_t>(EKind::released);
    delete object;
}

} // namespace

namespace discio {

void setLastError(int32_t code, const char* detail) noexcept {
    t_lastError.code = code;
    try {
        t_lastError.detail = detail;
    } catch (...) {
        t_lastError.detail.clear();
    }
}

void recordException() noexcept {
    try {
        throw;
    } catch (const CDiscError& error) {
        setLastError(error.getCode(), error.what());
    } catch (const std::bad_alloc&) {
        setLastError(DISCIO_ERROR_OUT_OF_MEMORY, "");
    } catch (const std::exception& error) {
        setLastError(DISCIO_ERROR_INTERNAL, error.what());
    } catch (...) {
        setLastError(DISCIO_ERROR_INTERNAL, "");
    }
}

} // namespace discio

DISCIO_Library* DISCIO_Create() {
    return DISCIO_CreateEx(DISCIO_API_VERSION, nullptr);
}

DISCIO_Library* DISCIO_CreateEx(uint32_t apiVersion, const DISCIO_Options* options) {
    return barrier<DISCIO_Library*>(nullptr, [&] {
        if (apiVersion != DISCIO_API_VERSION)
            throw CDiscError(DISCIO_ERROR_UNSUPPORTED_API_VERSION, std::to_string(apiVersion));
        const bool isEmpty = options && options->image && !*options->image;
        if (options && (options->size < sizeof(DISCIO_Options) || isEmpty))
            throw CDiscError(DISCIO_ERROR_INVALID_PARAM, isEmpty ? "the path of the image is empty" : "");
        std::string image = options && options->image ? toUTF8(options->image) : std::string();
        DISCIO_Library* library = makeHandle<DISCIO_Library>(EKind::library);
        library->image = std::move(image);
        return library;
    });
}

int32_t DISCIO_Release(void* handle) {
    return barrier<int32_t>(0, [&] {
        if (!handle) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
        switch (static_cast<EKind>(*static_cast<uint32_t*>(handle))) {
        case EKind::library:
            destroy<DISCIO_Library>(handle);
            break;
        case EKind::drive:
            destroy<DISCIO_Drive>(handle);
            break;
        case EKind::disc:
            destroy<DISCIO_Disc>(handle);
            break;
        case EKind::cursor:
            destroy<DISCIO_DataCursor>(handle);
            break;
        case EKind::project:
            destroy<DISCIO_Project>(handle);
            break;
        case EKind::stream:
            releaseStream(static_cast<DISCIO_PCMAudioStream*>(handle));
            break;
        default:
            throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
        }
        return 1;
    });
}

int32_t DISCIO_GetLastError(DISCIO_Library*) {
    return t_lastError.code;
}

const char16_t* DISCIO_GetErrorMessageW(DISCIO_Library*, int32_t code) {
    thread_local std::u16string t_text;
    return barrier<const char16_t*>(u"", [&] {
        std::string text = describeError(code);
        if (code == t_lastError.code && !t_lastError.detail.empty()) text += " (" + t_lastError.detail + ")";
        t_text = toUTF16(text);
        return t_text.c_str();
    });
}

int32_t DISCIO_EnumerateDrives(DISCIO_Library* library) {
    return barrier<int32_t>(0, [&] {
        DISCIO_Library& own = require(library);
        if (own.drives) return 1;
        Drives drives;
        if (!own.image.empty()) {
            drives.push_back(createImageDrive(own.image));
        } else {
            drives = findDeviceDrives();
            for (auto& drive : findFolderDrives()) drives.push_back(drive);
        }
        own.drives = std::move(drives);
        return 1;
    });
}

int32_t DISCIO_GetDriveCount(DISCIO_Library* library) {
    return barrier<int32_t>(0, [&] {
        const DISCIO_Library& own = require(library);
        return own.drives ? static_cast<int32_t>(own.drives->size()) : 0;
    });
}

DISCIO_Drive* DISCIO_OpenDrive(DISCIO_Library* library, int32_t index) {
    return barrier<DISCIO_Drive*>(nullptr, [&] {
        const DISCIO_Library& own = require(library);
        if (!own.drives || index < 0 || index >= static_cast<int32_t>(own.drives->size()))
            throw CDiscError(DISCIO_ERROR_NO_SUCH_OBJECT, "drive " + std::to_string(index));
        DISCIO_Drive* drive = makeHandle<DISCIO_Drive>(EKind::drive);
        drive->drive = (*own.drives)[static_cast<size_t>(index)];
        return drive;
    });
}
