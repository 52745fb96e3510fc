// The log that writes text to a file or another stream.
#pragma once

#include "peru/log/LogBase.h"
#include "peru/streams/IStreams.h"
#include "peru/threads/IMutex.h"

namespace peru {

// Appends lines such as
//   14:03:59 [source] info - text
// in UTF-8. Further lines of a message are aligned with its text. The depth of areas is per log, not per
// thread, so the indentation of several threads interleaves. Control characters and invalid bytes are written
// as "\xNN". Stream errors propagate to the caller.
class PERU_API CTextFileLog : public CLogBase {
public:
    // Opens the file for appending and creates it if necessary. Throws CFileError.
    CTextFileLog(const P<IURI>& file, bool flushEachLine);
    CTextFileLog(const P<IOutStream>& stream, bool flushEachLine);
    ~CTextFileLog() override;

    void enterArea(const P<IString>& name) override;
    void leaveArea(const P<IString>& name) override;
    void write(const SLogMessage& message) override;

private:
    P<IMutex> m_mutex; // guards all below
    P<IOutStream> m_stream;
    bool m_flush;
    int32_t m_depth = 0;
};

} // namespace peru
