// The functions of libburn.
#pragma once

#include <cstddef>
#include <string>
#include <sys/types.h>

#include <libburn/libburn.h> // in namespace burn

namespace discio {

// clang-format off
#define DISCIO_BURN_FUNCTIONS(use) \
    use(burn_initialize) use(burn_msgs_set_severities) use(burn_msgs_obtain) \
    use(burn_drive_scan_and_grab) use(burn_drive_info_free) use(burn_drive_release) \
    use(burn_drive_get_status) use(burn_drive_set_speed) use(burn_drive_cancel) use(burn_drive_wrote_well) \
    use(burn_read_data) \
    use(burn_disc_get_status) use(burn_disc_get_profile) use(burn_disc_erasable) use(burn_disc_erase) \
    use(burn_disc_available_space) use(burn_disc_create) use(burn_disc_free) use(burn_disc_add_session) \
    use(burn_disc_write) use(burn_precheck_write) use(burn_session_create) use(burn_session_free) \
    use(burn_session_add_track) use(burn_session_set_cdtext) use(burn_cdtext_from_session) \
    use(burn_track_create) use(burn_track_free) use(burn_track_define_data) use(burn_track_set_source) \
    use(burn_track_set_pregap_size) \
    use(burn_track_set_isrc_string) use(burn_track_set_cdtext) use(burn_source_free) \
    use(burn_write_opts_new) use(burn_write_opts_free) use(burn_write_opts_set_write_type) \
    use(burn_write_opts_auto_write_type) use(burn_write_opts_set_simulate) \
    use(burn_write_opts_set_underrun_proof) use(burn_write_opts_set_multi) \
    use(burn_write_opts_set_perform_opc) use(burn_write_opts_set_leadin_text) \
    use(burn_write_opts_set_mediacatalog) use(burn_write_opts_set_has_mediacatalog)
// clang-format on

struct SBurnLibrary {
    // Loads the library with the first call. Throws CDiscError if it is missing. Any thread.
    static const SBurnLibrary& get();

    // What the library reports about the last failure; empty if nothing.
    std::string takeMessage() const;

#define DISCIO_DECLARE(name) decltype(burn::name)* name = nullptr;
    DISCIO_BURN_FUNCTIONS(DISCIO_DECLARE)
#undef DISCIO_DECLARE

private:
    SBurnLibrary();
};

} // namespace discio
