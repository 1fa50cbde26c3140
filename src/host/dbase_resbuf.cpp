// Result-buffer lists: allocation, release, copies and the value kind of each type code.
#include <cstring>

#include "velhost/resbuf.h"

namespace {

char* CopyText(std::string_view text)
{
    char* s = new char[text.size() + 1];
    std::memcpy(s, text.data(), text.size());
    s[text.size()] = '\0';
    return s;
}

} // namespace

VelRbKind velRbKind(int restype)
{
    switch (restype) {
    case RTNONE:
        return VelRbKind::None;
    case RTREAL:
    case RTANG:
        return VelRbKind::Real;
    case RTPOINT:
    case RT3DPOINT:
        return VelRbKind::Point;
    case RTSHORT:
        return VelRbKind::Short;
    case RTLONG:
        return VelRbKind::Long;
    case RTSTR:
        return VelRbKind::String;
    case RTENAME:
        return VelRbKind::EntityName;
    default:
        break;
    }
    // DXF group codes, as XData and XRECORD data use them.
    const int c = restype;
    if (c == 1004)
        return VelRbKind::Binary;
    if ((c >= 1010 && c <= 1013) || (c >= 10 && c <= 18) || (c >= 110 && c <= 112) || c == 210)
        return VelRbKind::Point;
    if ((c >= 19 && c <= 59) || (c >= 113 && c <= 149) || (c >= 211 && c <= 239) || (c >= 460 && c <= 469) ||
        (c >= 1014 && c <= 1059))
        return VelRbKind::Real;
    if ((c >= 60 && c <= 79) || (c >= 170 && c <= 179) || (c >= 270 && c <= 299) || (c >= 370 && c <= 389) ||
        (c >= 400 && c <= 409) || (c >= 1060 && c <= 1070))
        return VelRbKind::Short;
    if ((c >= 90 && c <= 99) || (c >= 420 && c <= 429) || (c >= 440 && c <= 459) || c == 1071)
        return VelRbKind::Long;
    if ((c >= 0 && c <= 9) || (c >= 100 && c <= 109) || (c >= 160 && c <= 169) || (c >= 300 && c <= 369) ||
        (c >= 390 && c <= 399) || (c >= 410 && c <= 419) || (c >= 430 && c <= 439) || (c >= 470 && c <= 481) ||
        c == 999 || (c >= 1000 && c <= 1009))
        return VelRbKind::String;
    return VelRbKind::None;
}

resbuf* acutNewRb(int restype)
{
    auto* rb = new resbuf;
    rb->restype = static_cast<short>(restype);
    if (velRbKind(restype) == VelRbKind::String)
        rb->resval.rstring = CopyText("");
    return rb;
}

int acutRelRb(resbuf* list)
{
    while (list) {
        resbuf* next = list->rbnext;
        const VelRbKind kind = velRbKind(list->restype);
        if (kind == VelRbKind::String)
            delete[] list->resval.rstring;
        else if (kind == VelRbKind::Binary)
            delete[] list->resval.rbinary.buf;
        delete list;
        list = next;
    }
    return RTNORM;
}

resbuf* acutDupRb(const resbuf* list)
{
    VelRbBuilder copy;
    for (const resbuf* rb = list; rb; rb = rb->rbnext) {
        auto* c = new resbuf;
        c->restype = rb->restype;
        c->resval = rb->resval;
        const VelRbKind kind = velRbKind(rb->restype);
        if (kind == VelRbKind::String)
            c->resval.rstring = CopyText(rb->resval.rstring ? rb->resval.rstring : "");
        else if (kind == VelRbKind::Binary) {
            const short n = rb->resval.rbinary.buf ? rb->resval.rbinary.clen : 0;
            c->resval.rbinary.clen = n;
            c->resval.rbinary.buf = new char[n > 0 ? n : 1];
            if (n > 0)
                std::memcpy(c->resval.rbinary.buf, rb->resval.rbinary.buf, static_cast<std::size_t>(n));
        }
        copy.add(c);
    }
    return copy.release();
}

resbuf* velRbString(short restype, std::string_view text)
{
    auto* rb = new resbuf;
    rb->restype = restype;
    rb->resval.rstring = CopyText(text);
    return rb;
}

resbuf* velRbReal(short restype, double value)
{
    auto* rb = new resbuf;
    rb->restype = restype;
    rb->resval.rreal = value;
    return rb;
}

resbuf* velRbShort(short restype, short value)
{
    auto* rb = new resbuf;
    rb->restype = restype;
    rb->resval.rint = value;
    return rb;
}

resbuf* velRbLong(short restype, std::int32_t value)
{
    auto* rb = new resbuf;
    rb->restype = restype;
    rb->resval.rlong = value;
    return rb;
}

resbuf* velRbPoint(short restype, double x, double y, double z)
{
    auto* rb = new resbuf;
    rb->restype = restype;
    rb->resval.rpoint[0] = x;
    rb->resval.rpoint[1] = y;
    rb->resval.rpoint[2] = z;
    return rb;
}

resbuf* velRbBinary(std::string_view bytes)
{
    auto* rb = new resbuf;
    rb->restype = kXdBinaryChunk;
    const std::size_t n = bytes.size() > 32767 ? 32767 : bytes.size();
    rb->resval.rbinary.clen = static_cast<short>(n);
    rb->resval.rbinary.buf = new char[n > 0 ? n : 1];
    if (n > 0)
        std::memcpy(rb->resval.rbinary.buf, bytes.data(), n);
    return rb;
}

std::string velRbText(const resbuf* rb)
{
    if (rb == nullptr || velRbKind(rb->restype) != VelRbKind::String || rb->resval.rstring == nullptr)
        return std::string();
    return rb->resval.rstring;
}

VelRbBuilder& VelRbBuilder::add(resbuf* rb)
{
    if (rb == nullptr)
        return *this;
    if (!head_)
        head_.reset(rb);
    else
        tail_->rbnext = rb;
    tail_ = rb;
    while (tail_->rbnext)
        tail_ = tail_->rbnext;
    return *this;
}
