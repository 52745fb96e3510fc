// Requests and answers of all remote procedures, and the objects in them, byte for byte.
#include "peru/remote/RemoteException.h"
#include "peru/remote/RemoteStreamClient.h"
#include "peru/strings/HexData.h"
#include "sonora2/boxed/AudioRun.h"
#include "sonora2/boxed/IFormatServer.h"
#include "sonora2/boxed/ISonoraPluginRemote.h"
#include "sonora2/boxed/ISourceServer.h"
#include "sonora2/boxed/RemoteFacets.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/pictures/SonoraPictureRemote.h"
#include "sonora2/pictures/YV12Picture.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "support/MediaBase.h"

#include <gtest/gtest.h>

#include <sstream>

namespace tests {

namespace {

using namespace sonora2::common;
using namespace std::string_literals;
using peru::CString;
using peru::make;
using peru::P;
using Plugin = ISonoraPluginRemote;
using Source = ISourceServer;
using Format = IFormatServer;
using Facets = SRemoteFacets;

struct SRow {
    P<peru::CRemoteProc> proc;
    // Kind, name, each parameter with the letter of its type, and "=" with the letter of the result.
    std::string form;
};

// The forms are separated by semicolons.
template <class... Procs> std::vector<SRow> rows(const char* forms) {
    const P<peru::CRemoteProc> procs[] = {make<Procs>()...};
    std::vector<SRow> all;
    std::istringstream list(forms);
    for (std::string form; std::getline(list, form, ';');) all.push_back({procs[all.size()], form});
    EXPECT_EQ(sizeof...(Procs), all.size());
    return all;
}

// Spaces separate the parts.
std::string hex(std::string digits) {
    std::erase(digits, ' ');
    const std::vector<uint8_t> bytes = peru::parseHexData(CString::fromUTF8(digits));
    return {bytes.begin(), bytes.end()};
}

// A text of less than 256 bytes.
std::string wire(const std::string& text) {
    return std::string(1, static_cast<char>(text.size())) + "\0\0\0"s + text;
}

// The value of each type that crosses in this test.
std::string valueOf(char type) {
    const std::string zeros(100, '\0');
    switch (type) {
    case 'i':
        return hex("04030201");
    case 'l':
        return hex("0807060504030201");
    case 'd':
        return hex("000000000000F83F"); // 1.5
    case 'b':
        return hex("01");
    case 't':
        return hex("02000000C3A4"); // an a with two dots
    case 'u':
        return hex("00") + wire("file:///a");
    case 'S': // the size on the wire, and the one in the record
        return hex("14000000 14000000 00000000 80BB0000 02000000 03000000");
    case 'F':
        return hex("74000000 74000000") + zeros.substr(0, 92) + hex("80BB0000 02000000 03000000") +
               zeros.substr(0, 8);
    default:
        return hex("01"); // no object
    }
}

template <class Params> Params makeParams() {
    Params params;
    params.nSampleRate = 48'000;
    params.nChannelCount = 2;
    params.nBytesPerSample = 3;
    return params;
}

void setValue(const P<peru::CRemoteVar>& var) {
    if (const auto number = peru::tryCast<peru::CRemoteVarInteger>(var)) number->setValue(0x01020304);
    if (const auto time = peru::tryCast<peru::CRemoteVarDouble>(var)) time->setValue(1.5);
    if (const auto flag = peru::tryCast<peru::CRemoteVarBool>(var)) flag->setValue(true);
    if (const auto uri = peru::tryCast<peru::CRemoteVarURI>(var))
        uri->setValue(make<peru::CURI>(peru::newString("file:///a")));
    if (const auto record = peru::tryCast<peru::CRemoteVarStruct<Plugin::SSourceParams>>(var))
        record->setValue(makeParams<Plugin::SSourceParams>());
    if (const auto record = peru::tryCast<peru::CRemoteVarStruct<Plugin::SFormatParams>>(var))
        record->setValue(makeParams<Plugin::SFormatParams>());
}

// Calls the procedure with the answer prepared, and compares what was sent and received.
void expectForm(const SRow& row) {
    SCOPED_TRACE(row.form);
    std::istringstream words(row.form);
    std::string kind, name, request, answer, word;
    words >> kind >> name;
    request = wire(kind) + wire(name);
    while (words >> word) {
        const char type = word.back();
        if (word.front() == '=')
            answer = wire("return") + wire("Result") + valueOf(type);
        else
            request += wire(word.substr(0, word.size() - 2)) + valueOf(type);
    }
    request += wire("execute");

    for (const P<peru::CRemoteVar>& param : row.proc->getParams()) setValue(param);
    const auto in = make<peru::CMemoryIOStream>(), out = make<peru::CMemoryIOStream>();
    in->write(answer.data(), static_cast<int64_t>(answer.size()));
    in->reset();
    make<peru::CRemoteStreamClient>(in, out)->call(row.proc);
    EXPECT_EQ(request, std::string(reinterpret_cast<const char*>(out->getBlock()->getData()),
                                   static_cast<size_t>(out->getSize())));
    EXPECT_EQ(static_cast<int64_t>(answer.size()), in->getPosition()) << "the answer is read to its end";
    if (row.proc->isVoid()) return;
    const P<peru::CRemoteFunction> function(row.proc);
    EXPECT_EQ(answer.substr(10), serialise(function->getResult())) << "and understood";
}

TEST(WireTable, OfThePlugin) {
    for (const SRow& row : rows<Plugin::getLogFunction, Plugin::getPluginNameFunction,
                                Plugin::getValidTypesFunction, Plugin::getValidExtensionsFunction,
                                Plugin::tryCreateSourceFunction, Plugin::tryCreateFormatFunction>(
             "function getLog =t;function getPluginName =t;function getValidTypes =i;"
             "function getValidExtensions nTypes:i =o;"
             "function tryCreateSource uri:u nTypes:i bDontCloseAfterTesting:b pParams:S =o;"
             "function tryCreateFormat uri:u nTypes:i bDontCloseAfterTesting:b pParams:F =o"))
        expectForm(row);
}

TEST(WireTable, OfSources) {
    for (const SRow& row :
         rows<Source::getLogFunction, Source::isOpenedFunction, Source::openProc, Source::closeProc,
              Source::skipToTimeProc, Source::getDurationFunction, Source::getBufferStatusFunction,
              Source::isEOFFunction, Source::setStartTimeProc, Source::getStartTimeFunction,
              Source::getURIFunction, Source::getPluginNameFunction, Source::setMaxSizeProc,
              Source::getWidthFunction, Source::getHeightFunction, Source::peekNextPictureTimestampFunction,
              Source::getNextPictureFunction, Source::getPixelAspectNumFunction,
              Source::getPixelAspectDenFunction, Source::getFrameDurationFunction,
              Source::getFrameRateNumFunction, Source::getFrameRateDenFunction,
              Source::getAudioStreamInfosFunction, Source::setAudioStreamProc,
              Source::getNextAudioChunkFunction, Source::getSampleRateFunction,
              Source::getChannelCountFunction, Source::getBytesPerSampleFunction,
              Source::getNextAudioChunksFunction, getStateFunction>(
             "function getLog =t;function isOpened =b;void open;void close;"
             "void skipToTime fTimestamp:d;function getDuration =d;function getBufferStatus =i;"
             "function isEOF =b;void setStartTime fStartTime:d;function getStartTime =d;"
             "function getURI =u;function getPluginName =t;void setMaxSize nWidth:i nHeight:i;"
             "function getWidth =i;function getHeight =i;function peekNextPictureTimestamp =d;"
             "function getNextPicture =o;function getPixelAspectNum =i;"
             "function getPixelAspectDen =i;function getFrameDuration =d;"
             "function getFrameRateNum =i;function getFrameRateDen =i;"
             "function getAudioStreamInfos =o;void setAudioStream nAudioIndex:i;"
             "function getNextAudioChunk =o;function getSampleRate =i;function getChannelCount =i;"
             "function getBytesPerSample =i;function getNextAudioChunks nMaxBytes:i =o;"
             "function getState =o"))
        expectForm(row);
}

TEST(WireTable, OfFormats) {
    for (const SRow& row :
         rows<Format::getLogFunction, Format::isOpenedFunction, Format::openProc, Format::closeProc,
              Format::getURIFunction, Format::getPluginNameFunction, Format::getEstimatedSizeBytesFunction,
              Format::getVideoParameterFunction, Format::writeFrameProc, Format::getWantedImageTypeFunction,
              Format::getSampleRateFunction, Format::getChannelCountFunction,
              Format::getBytesPerSampleFunction, Format::setAudioQualityProc, Format::setAudioBitRateProc,
              Format::writeAudioChunkProc>(
             "function getLog =t;function isOpened =b;void open;void close;function getURI =u;"
             "function getPluginName =t;function getEstimatedSizeBytes fDuration:d =l;"
             "function getVideoParameter =F;void writeFrame pPicture:o;"
             "function getWantedImageType =i;function getSampleRate =i;function getChannelCount =i;"
             "function getBytesPerSample =i;void setAudioQuality fQuality:d;"
             "void setAudioBitRate nNominal:i nMin:i nMax:i;void writeAudioChunk pAudioChunk:o"))
        expectForm(row);
}

TEST(WireTable, OfOptionalInterfaces) {
    for (const SRow& row :
         rows<Facets::canUseFloatFunction, Facets::useFloatFunction, Facets::setSalvageFunction,
              Facets::getSalvageFunction, Facets::setClippingPreventionFunction,
              Facets::getClippingPreventionFunction, Facets::getMediaDescriptionFunction,
              Facets::setDeliveredFormatFunction, Facets::takeWarningsFunction, Facets::discardFunction>(
             "function canUseFloat nBytesPerSample:i =b;function useFloat nBytesPerSample:i =b;"
             "function setSalvage bSalvage:b =b;function getSalvage =b;"
             "function setClippingPrevention bPrevent:b =b;function getClippingPrevention =b;"
             "function getMediaDescription =o;"
             "function setDeliveredFormat nSampleRate:i nChannelCount:i nBytesPerSample:i =b;"
             "function takeWarnings =t;function discard =b"))
        expectForm(row);
}

// Objects without the prelude and the check word that every object has.
TEST(WireTable, OfObjects) {
    const P<peru::IMemoryManager> memory = make<peru::CMemoryManager>();
    const auto expectObject = [](const P<peru::ISerializable>& object, const std::string& bytes) {
        for (int i = 0; i < 2; ++i) deserialise(object, bytes); // replaces what is there
        EXPECT_EQ(bytes, serialise(object));
    };
    expectObject(make<CRemoteCreated>(), "");
    expectObject(make<CPluginExtensions>(), hex("02000000") + wire("wav") + wire("w64"));
    const auto infos = make<sonora2::audio::CAudioStreamInfos>();
    expectObject(infos, hex("02000000 01000000") + wire("Main") + wire("de") + hex("07000000") + wire("") +
                            wire(""));
    EXPECT_EQ(7, infos->getStreamInfo(1)->getStreamIndex());
    const auto run = make<sonora2::audio::CAudioRun>(memory);
    expectObject(run, hex("03000000 01 000000000000F83F 03000000 616263 01 000000000000E03F 00000000 00"
                          "01 000000000000F83F") +
                          wire("broken") + wire("log"));
    EXPECT_TRUE(run->isEOF && run->duration == 1.5 && run->chunks.at(0)->getTimestamp() == 1.5);
    EXPECT_EQ("abc", bytesOf(run->chunks.at(0)));
    EXPECT_EQ("broken", CString::toStdString(run->failure));
    // More chunks than a run has, each of one byte.
    EXPECT_THROW(deserialise(run, hex("41000000") + std::string(100, '\0')), peru::CRemoteException);
    const auto state = make<CRemoteMediaState>();
    expectObject(state, hex("01 00 43000000 000000000000F83F 000000000000E03F 80BB0000 02000000 03000000 "
                            "05000000") +
                            wire("failure") + wire("log"));
    EXPECT_EQ(kFacetVideo | kFacetAudio | kFacetDiscardable, state->facets);
    EXPECT_TRUE(state->isOpened && !state->isEOF && state->duration == 1.5 && state->startTime == 0.5);
    EXPECT_TRUE(state->sampleRate == 48'000 && state->channelCount == 2 && state->bytesPerSample == 3 &&
                state->usedSettings == 5);
    const auto description = make<CRemoteMediaDescription>();
    expectObject(description, wire("FLAC") + hex("00010000 00000000 80BB0000 02000000 03000000"));
    EXPECT_TRUE(description->bitRate == 256 && description->bytesPerSample == 3);
    const auto picture = make<CSonoraPictureRemote>(memory);
    expectObject(picture, hex("04000000 000000000000F83F 02000000 02000000 01 06000000 010203040506"));
    EXPECT_TRUE(peru::tryCast<CYV12Picture>(picture->getPicture()));
}

} // namespace

} // namespace tests
