// Writing a whole drawing: the bytes of every record that did not change copied as they
// were, changed and added objects and changed header variables written anew, binary
// drawings converted back to binary.
#include "host/dxf/drawing.hpp"

#include "host/dxf/binary.hpp"

namespace vel::dxf {

bool DrawingFile::Write(const Sink& sink, std::string& error) const
{
    if (!binary_)
        return WriteText(sink, error);
    std::string text;
    if (!WriteText(
            [&](std::string_view piece) {
                text.append(piece);
                return true;
            },
            error))
        return false;
    std::string bytes;
    if (!TextToBinary(text, wideCodes_, bytes, error)) {
        error = "conversion en DXF binaire impossible, " + error;
        return false;
    }
    if (!sink(bytes)) {
        error = "écriture interrompue";
        return false;
    }
    return true;
}

bool DrawingFile::WriteText(const Sink& sink, std::string& error) const
{
    const std::string_view buf = source_->view();
    const std::string& eol = sections_.eol();
    Writer w(buf, sink);
    const std::vector<std::string> changed = ChangedHeaderVars();
    const bool header = !changed.empty();
    const std::size_t headerRecord = sections_.header();
    if (sourceCount_ > 0)
        w.Raw(0, sections_[0].begin);
    if (header && headerRecord == SIZE_MAX)
        header_.Write(w, nullptr, changed, handles_.next(), eol);
    for (std::size_t i = 0; i < sourceCount_; ++i) {
        const auto ins = insertions_.find(i);
        if (ins != insertions_.end())
            for (std::size_t k : ins->second)
                WriteObject(*bodies_[k], w.Buffer(), eol);
        const Record& rec = sections_[i];
        if (i == headerRecord && header)
            header_.Write(w, &rec, changed, handles_.next(), eol);
        else if (bodies_[i] && bodies_[i]->dirty)
            WriteObject(*bodies_[i], w.Buffer(), eol);
        else
            w.Raw(rec.begin, rec.end);
    }
    if (sourceCount_ > 0)
        w.Raw(sections_[sourceCount_ - 1].end, buf.size());
    if (!w.Finish()) {
        error = "écriture interrompue";
        return false;
    }
    return true;
}

} // namespace vel::dxf
