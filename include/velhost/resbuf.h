// Result buffers of the stand-in host: the linked lists of typed values that system
// variables, keyword input and extended entity data (XData) travel in.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

// Value types of a result buffer that is not XData.
constexpr short RTNONE = 5000;    // no value
constexpr short RTREAL = 5001;    // real
constexpr short RTPOINT = 5002;   // 2D point (z ignored)
constexpr short RTSHORT = 5003;   // 16-bit integer
constexpr short RTANG = 5004;     // angle (real)
constexpr short RTSTR = 5005;     // text
constexpr short RTENAME = 5006;   // entity name
constexpr short RT3DPOINT = 5009; // 3D point
constexpr short RTLONG = 5010;    // 32-bit integer

// Status answers of the host's input and variable functions.
constexpr int RTNORM = 5100;
constexpr int RTERROR = -5001;
constexpr int RTCAN = -5002;

// DXF group codes of the XData items; a result buffer of XData carries them as restype.
constexpr short kXdAsciiString = 1000;   // text
constexpr short kXdRegAppName = 1001;    // application name, starts each application's list
constexpr short kXdControlString = 1002; // "{" or "}" around a nested group
constexpr short kXdLayerName = 1003;     // layer name
constexpr short kXdBinaryChunk = 1004;   // up to 127 bytes (rbinary)
constexpr short kXdHandle = 1005;        // database handle as hexadecimal text
constexpr short kXdXCoord = 1010;        // point
constexpr short kXdWorldXCoord = 1011;   // world position
constexpr short kXdWorldXDisp = 1012;    // world displacement
constexpr short kXdWorldXDir = 1013;     // world direction
constexpr short kXdReal = 1040;          // real
constexpr short kXdDist = 1041;          // distance
constexpr short kXdScale = 1042;         // scale factor
constexpr short kXdInteger16 = 1070;     // 16-bit signed integer
constexpr short kXdInteger32 = 1071;     // 32-bit signed integer

// Binary data of a 1004 item.
struct ads_binary {
    short clen;
    char* buf;
};

// One typed value and the link to the next. Texts (rstring) and binary chunks are owned
// by the buffer and freed by acutRelRb; every string is UTF-8 and NUL-terminated.
struct resbuf {
    resbuf* rbnext = nullptr;
    short restype = RTNONE;
    union {
        double rreal;
        double rpoint[3];
        short rint;
        std::int32_t rlong;
        char* rstring;
        std::int64_t rlname[2];
        ads_binary rbinary;
    } resval{};
};

// What a restype carries, so that readers need not know every code.
enum class VelRbKind { None, Real, Point, Short, Long, String, Binary, EntityName };
VelRbKind velRbKind(int restype);

// A new buffer of the given type with a zero value (empty text for a text type).
resbuf* acutNewRb(int restype);

// Frees a whole list (null allowed); answers RTNORM.
int acutRelRb(resbuf* list);

// Deep copy of a whole list (null for null).
resbuf* acutDupRb(const resbuf* list);

// Builders for single buffers; the text is copied.
resbuf* velRbString(short restype, std::string_view text);
resbuf* velRbReal(short restype, double value);
resbuf* velRbShort(short restype, short value);
resbuf* velRbLong(short restype, std::int32_t value);
resbuf* velRbPoint(short restype, double x, double y, double z);
resbuf* velRbBinary(std::string_view bytes);

// Text of a buffer of a text type ("" otherwise).
std::string velRbText(const resbuf* rb);

// Owns a list and frees it with acutRelRb.
struct VelRbDeleter {
    void operator()(resbuf* list) const { acutRelRb(list); }
};
using VelRbPtr = std::unique_ptr<resbuf, VelRbDeleter>;

// Appends buffers to a list in order: `VelRbBuilder b; b.add(velRbString(...)); b.release()`.
class VelRbBuilder {
public:
    VelRbBuilder& add(resbuf* rb);
    resbuf* head() const { return head_.get(); }
    resbuf* release()
    {
        tail_ = nullptr;
        return head_.release();
    }

private:
    VelRbPtr head_;
    resbuf* tail_ = nullptr;
};
