// The top of the DXF writer: what is written goes out in consecutive pieces, runs of the
// file's own bytes in one piece each, new text gathered in a buffer.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace vel::dxf {

// Receives the pieces in order; a false answer stops the writing.
using Sink = std::function<bool(std::string_view)>;

class Writer {
public:
    Writer(std::string_view source, const Sink& sink) : source_(source), sink_(sink) {}

    // The source's bytes [begin, end); joins the run before it when they follow on.
    void Raw(std::uint64_t begin, std::uint64_t end)
    {
        if (begin >= end)
            return;
        FlushPending();
        if (run_ && runEnd_ == begin) {
            runEnd_ = end;
            return;
        }
        FlushRun();
        run_ = true;
        runBegin_ = begin;
        runEnd_ = end;
    }

    // The buffer new text is appended to.
    std::string& Buffer()
    {
        FlushRun();
        return pending_;
    }

    void Text(std::string_view text)
    {
        Buffer().append(text);
        if (pending_.size() > (1u << 20))
            FlushPending();
    }

    // Sends what is left; false when the sink stopped the writing.
    bool Finish()
    {
        FlushRun();
        FlushPending();
        return ok_;
    }

private:
    void FlushRun()
    {
        if (!run_)
            return;
        run_ = false;
        if (ok_)
            ok_ = sink_(source_.substr(runBegin_, runEnd_ - runBegin_));
    }

    void FlushPending()
    {
        if (pending_.empty())
            return;
        if (ok_)
            ok_ = sink_(pending_);
        pending_.clear();
    }

    std::string_view source_;
    const Sink& sink_;
    std::string pending_;
    bool run_ = false;
    std::uint64_t runBegin_ = 0;
    std::uint64_t runEnd_ = 0;
    bool ok_ = true;
};

} // namespace vel::dxf
