#include "Medium.h"
#include "writing/Burner.h"

#include <cstdlib>
#include <new>

namespace discio {

namespace {

struct SSource {
    SFeed feed;
    std::shared_ptr<CBurnSession::SShared> shared;
};

SSource& get(burn::burn_source* source) {
    return *static_cast<SSource*>(source->data);
}

// Fewer bytes than wanted are returned only at the end. Called by C code.
int readSource(burn::burn_source* source, unsigned char* data, int size) noexcept {
    SSource& own = get(source);
    try {
        int done = 0;
        while (done < size) {
            const size_t count = own.feed.read(data + done, static_cast<size_t>(size - done));
            if (count == 0) break;
            done += static_cast<int>(count);
        }
        own.shared->done += done;
        return done;
    } catch (const CDiscError& error) {
        own.shared->failure.set(error);
    } catch (...) {
        own.shared->failure.set(CDiscError(DISCIO_ERROR_INTERNAL, "a source failed"));
    }
    return -1;
}

// The library releases it with free().
burn::burn_source* makeSource(SFeed feed, const std::shared_ptr<CBurnSession::SShared>& shared) {
    auto own = std::make_unique<SSource>(SSource{std::move(feed), shared});
    auto* const source = static_cast<burn::burn_source*>(std::calloc(1, sizeof(burn::burn_source)));
    if (!source) throw std::bad_alloc();
    source->refcount = 1;
    source->version = 1;
    source->get_size = [](burn::burn_source* from) -> off_t { return get(from).feed.size; };
    source->set_size = [](burn::burn_source*, off_t) { return 0; };
    source->free_data = [](burn::burn_source* from) { delete &get(from); };
    source->read_xt = readSource;
    source->cancel = [](burn::burn_source*) { return 1; };
    source->data = own.release();
    return source;
}

} // namespace

CBurnSession::CBurnSession()
    : m_library(SBurnLibrary::get()), m_disc(m_library.burn_disc_create()),
      m_session(m_library.burn_session_create()) {
    m_library.burn_disc_add_session(m_disc, m_session, BURN_POS_END);
}

CBurnSession::~CBurnSession() {
    m_library.burn_session_free(m_session);
    m_library.burn_disc_free(m_disc);
}

double CBurnSession::getFraction() const {
    return m_total > 0 ? static_cast<double>(m_shared->done) / static_cast<double>(m_total) : 0.0;
}

burn::burn_track* CBurnSession::addTrack(SFeed feed, int mode, int pad) {
    m_total += feed.size;
    ++m_tracks;
    burn::burn_track* const track = m_library.burn_track_create();
    m_library.burn_track_define_data(track, 0, 0, pad, mode);
    burn::burn_source* const source = makeSource(std::move(feed), m_shared);
    const bool isDone = m_library.burn_track_set_source(track, source) == burn::BURN_SOURCE_OK;
    m_library.burn_source_free(source); // the track has a reference of its own
    m_library.burn_session_add_track(m_session, track, BURN_POS_END);
    m_library.burn_track_free(track); // so has the session
    if (!isDone) throw CDiscError(DISCIO_ERROR_INTERNAL, m_library.takeMessage());
    return track;
}

void CBurnSession::addAudioTrack(SFeed feed, int32_t pregap, const std::string& isrc) {
    const bool isFirst = m_tracks == 0;
    m_blocks += feed.size / kAudioSectorBytes + (isFirst ? 0 : pregap);
    burn::burn_track* const track = addTrack(std::move(feed), BURN_AUDIO, 1);
    if (!isFirst && pregap > 0) m_library.burn_track_set_pregap_size(track, pregap, 0);
    if (isrc.empty()) return;
    char code[13] = {};
    isrc.copy(code, sizeof code - 1);
    m_library.burn_track_set_isrc_string(track, code, 0);
}

void CBurnSession::addDataTrack(SFeed feed) {
    m_blocks += feed.size / kDataSectorBytes;
    addTrack(std::move(feed), BURN_MODE1, 0);
}

} // namespace discio
