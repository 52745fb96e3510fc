// The plug-ins over libav, and files made by another program.
#pragma once

#include "plugins/PluginFixture.h"

namespace tests {

struct SSoundCase {
    const char* name;
    const char* options; // for ffmpeg
    int width;           // bytes per sample as delivered
    int frames = 0;      // if the end is trimmed, which the other program does not do
    int rate = 44100;
    int channels = 2;
};

inline const SSoundCase kSoundCases[] = {
    {"aac.m4a", "-c:a aac -aac_pns 0", 2, 60007},
    {"fragments.m4a", "-c:a aac -aac_pns 0 -movflags +frag_keyframe+empty_moov -frag_duration 300000", 2,
     60007 + 1024},
    {"live.m4a",
     "-c:a aac -aac_pns 0 -movflags frag_keyframe+empty_moov -frag_duration 300000 -f mp4 pipe:1 >", 2,
     60007 + 1024},
    {"alac16.m4a", "-c:a alac -sample_fmt s16p", 2, 60007},
    {"alac24.m4b", "-c:a alac", 3, 60007},
    {"six.m4a", "-c:a aac -aac_pns 0", 2, 60007, 48000, 6},
    {"x.aac", "-c:a aac -aac_pns 0", 2},
    {"x.opus", "-c:a libopus", 2},
    {"x.spx", "-c:a libspeex", 2, 0, 16000, 1},
    {"opus.mka", "-c:a libopus", 2},
    {"flac.mka", "-c:a flac -sample_fmt s16", 2},
    {"x.wv", "-c:a wavpack -sample_fmt s16p", 2},
    {"u8.nut", "-c:a pcm_u8", 1},
    {"float.wv", "-c:a wavpack -sample_fmt fltp", 4},
    {"x.tta", "", 3},
    {"x.ac3", "", 2},
    {"x.eac3", "", 2, 0, 48000, 6},
    {"x.dts", "-c:a dca -strict -2", 2},
    {"x.thd", "-c:a truehd -strict -2", 3, 0, 48000, 2},
    {"x.wma", "-c:a wmav2", 2},
    {"x.asf", "-c:a wmav1", 2},
    {"x.adx", "", 2},
    {"x.gsm", "-c:a libgsm", 2, 0, 8000, 1},
    {"x.mov", "-c:a pcm_s24le", 3, 60007},
    {"x.flv", "-c:a libmp3lame", 2},
    {"aac.mkv", "-c:a aac -aac_pns 0", 2},
    {"vorbis.webm", "-c:a libvorbis", 2},
    {"mp3.avi", "-c:a libmp3lame", 2},
    {"x.mpg", "-c:a mp2", 2},
    {"x.ts", "-c:a aac -aac_pns 0", 2},
    {"x.nut", "-c:a pcm_f32le", 4},
    {"double.nut", "-c:a pcm_f64le", 4},
};

inline std::string printSound(const testing::TestParamInfo<SSoundCase>& row) {
    std::string name = row.param.name;
    std::ranges::replace(name, '.', '_');
    return name;
}

class CAvTest : public CPluginTest {
protected:
    CAvTest() {
        context->clearPluginNames();
        for (const char* name : {"sonora2_wmf", "sonora2_dsgraph"}) context->addPluginName(name);
        handler = peru::make<sonora2::common::CPluginHandler>(context);
    }

    static constexpr int kFrames = 60007;

    // in.wav: 24 bits, so that codecs that keep them are told from others.
    void makeInput(int rate = 44100, int channels = 2) {
        const SShape shape{rate, channels, 3};
        folder.write("in.raw", makeMusic(shape, kFrames));
        run("ffmpeg -v error -y -f s24le -ar " + std::to_string(rate) + " -ac " + std::to_string(channels) +
            " -i in.raw -c:a pcm_s24le in.wav");
    }
    void encode(const std::string& options, const std::string& name) {
        run("ffmpeg -v error -y -i in.wav " + options + " " + name);
    }
    // The plug-in's source in the file's own format; throws the plug-in's error.
    P<IAudioSource> openAv(const std::string& name) {
        const std::string extension = name.substr(name.rfind('.') + 1);
        const bool isWindows = extension == "wma" || extension == "asf" || extension == "wmv";
        return openOwn(folder / name, isWindows ? "sonora2_wmf" : "sonora2_dsgraph");
    }
};

} // namespace tests
