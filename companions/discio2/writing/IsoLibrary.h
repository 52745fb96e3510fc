// The functions of libisofs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <sys/stat.h>
#include <sys/types.h>

#define LIBISOFS_WITHOUT_LIBBURN // declares burn_source itself
#include <libisofs/libisofs.h>

namespace discio {

// clang-format off
#define DISCIO_ISO_FUNCTIONS(use) \
    use(iso_init) use(iso_set_msgs_severities) use(iso_set_local_charset) use(iso_error_to_msg) \
    use(iso_image_new) use(iso_image_unref) use(iso_image_get_root) use(iso_image_set_volume_id) \
    use(iso_image_add_new_dir) use(iso_image_add_new_file) use(iso_image_create_burn_source) \
    use(iso_node_set_permissions) use(iso_node_set_uid) use(iso_node_set_gid) use(iso_node_set_mtime) \
    use(iso_node_set_atime) use(iso_node_set_ctime) use(iso_stream_unref) use(iso_write_opts_new) \
    use(iso_write_opts_free) use(iso_write_opts_set_iso_level) use(iso_write_opts_set_rockridge) \
    use(iso_write_opts_set_joliet) use(iso_write_opts_set_joliet_longer_paths) \
    use(iso_write_opts_set_joliet_long_names) use(iso_write_opts_set_allow_deep_paths) \
    use(iso_write_opts_set_allow_longer_paths) use(iso_write_opts_set_omit_version_numbers) \
    use(iso_write_opts_set_relaxed_vol_atts) use(iso_write_opts_set_dir_rec_mtime) \
    use(iso_write_opts_set_always_gmt) use(iso_write_opts_set_output_charset) \
    use(iso_write_opts_set_tail_blocks) use(iso_read_opts_new) use(iso_read_opts_free) \
    use(iso_read_opts_set_start_block) use(iso_read_opts_set_no_aaip) use(iso_read_opts_set_no_md5) \
    use(iso_read_opts_set_ecma119_map) use(iso_data_source_unref) use(iso_image_import) \
    use(iso_image_get_volume_id) use(iso_dir_get_children) use(iso_dir_iter_next) use(iso_dir_iter_free) \
    use(iso_node_get_type) use(iso_node_get_name) use(iso_node_get_mtime) use(iso_file_get_size) \
    use(iso_file_get_old_image_sections)
// clang-format on

struct SIsoLibrary {
    // Loads the library with the first call. Throws CDiscError if it is missing. Any thread.
    static const SIsoLibrary& get();

    // Throws CDiscError for a negative result of the library; `subject` is what it works on.
    int check(int result, const std::string& subject) const;

#define DISCIO_DECLARE(name) decltype(::name)* name = nullptr;
    DISCIO_ISO_FUNCTIONS(DISCIO_DECLARE)
#undef DISCIO_DECLARE

private:
    SIsoLibrary();
};

} // namespace discio
