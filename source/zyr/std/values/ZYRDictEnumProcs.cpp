// Dictionary printing and copying callbacks.
#include "zyr/std/values/ZYRDictEnumProcs.h"

#include <iomanip>

#include "zyr/std/values/CZYRString.h"

namespace ZYRStd {

namespace {
constexpr unsigned int kMaxPrintedBytes = 16;
}

ZYRDictEnumProcs::~ZYRDictEnumProcs() = default;

// Prints nothing below depth 2; a failed write stops the enumeration.
template <class Write> bool ZYRDictEnumProcs::entry(I_UniString*, Write write) {
    if (depth_ < 2)
        return false;
    try {
        write();
        return true;
    } catch (...) {
        return false;
    }
}

ZYRDictEnumProcs ZYRDictEnumProcs::nested(const void* container) const {
    ZYRDictEnumProcs inner(out_, depth_ == 0 ? 0 : depth_ - 1, indent_ + 1);
    inner.parent_ = this;
    inner.container_ = container;
    inner.level_ = level_ + 1;
    return inner;
}

// A container that holds itself, directly or further down, would be walked for ever: it is
// printed once and its reappearance marked. The walk goes at most kMaxNesting levels deep,
// so deeply nested input cannot exhaust the stack.
bool ZYRDictEnumProcs::refuseToDescend(const void* container) {
    for (const ZYRDictEnumProcs* walk = this; walk; walk = walk->parent_) {
        if (walk->container_ == container) {
            out_ << "<cycle>" << std::endl;
            return true;
        }
    }
    if (level_ + 1 > kMaxNesting) {
        out_ << "..." << std::endl;
        return true;
    }
    return false;
}

void ZYRDictEnumProcs::printIndent() {
    for (unsigned int i = 0; i < indent_; ++i)
        out_ << '\t';
}

void ZYRDictEnumProcs::printKey(I_UniString* text, I_Error&) {
    printIndent();
    out_ << UniStringToString(CZYRUniString(text, true)).c_str() << ' ';
}

void ZYRDictEnumProcs::printDataBufferContents(ZYRPublic::I_DataBuffer* buffer, I_Error&) {
    out_ << '<';
    if (buffer) {
        const auto* bytes = reinterpret_cast<const unsigned char*>(buffer->getBuffer());
        const unsigned int shown = std::min(buffer->getLength(), kMaxPrintedBytes);
        const auto flags = out_.flags();
        const char fill = out_.fill();
        for (unsigned int i = 0; i < shown; ++i)
            out_ << std::hex << std::setw(2) << std::setfill('0') << unsigned{bytes[i]};
        out_.flags(flags);
        out_.fill(fill);
    }
    out_ << '>' << std::endl;
}

void ZYRDictEnumProcs::printArrayContents(ZYRDictEnumProcs* procs, I_Array* array, I_Error& err) {
    if (!array)
        return;
    const unsigned int length = array->getLength(err);
    for (unsigned int i = 0; i < length; ++i) {
        auto head = [&] {
            procs->printIndent();
            out_ << '[' << i << "] ";
        };
        C_Error local;
        switch (array->getType(i)) {
        case ZYRPublic::kZYRValTypeNone:
            head();
            out_ << "???" << std::endl;
            break;
        case ZYRPublic::kZYRValTypeBool: {
            bool value;
            if (array->get(i, &value, local)) {
                head();
                out_ << " [ZYRBool]: " << (value ? 1 : 0) << std::endl;
            }
            break;
        }
        case ZYRPublic::kZYRValTypeInt: {
            int32_t value;
            if (array->get(i, &value, local)) {
                head();
                out_ << " [ZYRINT]: " << value << std::endl;
            }
            break;
        }
        case ZYRPublic::kZYRValTypeUInt: {
            unsigned int value;
            if (array->get(i, &value, local)) {
                head();
                out_ << " [ZYRUINT]: " << value << std::endl;
            }
            break;
        }
        case ZYRPublic::kZYRValTypeDouble: {
            double value;
            if (array->get(i, &value, local)) {
                head();
                out_ << " [ZYRDouble]: " << value << std::endl;
            }
            break;
        }
        case ZYRPublic::kZYRValTypeString: {
            I_UniString* value = nullptr;
            if (array->get(i, &value, local)) {
                const CZYRUniString text(value, false);
                head();
                out_ << " [ZYRUniString]: " << UniStringToString(text).c_str() << ' ' << std::endl;
            }
            break;
        }
        case ZYRPublic::kZYRValTypeDict: {
            I_Dict* value = nullptr;
            if (array->get(i, &value, local)) {
                const CZYRDict dict(value, false);
                head();
                if (value && procs->refuseToDescend(value))
                    break;
                out_ << "[ZYRDict]" << std::endl;
                ZYRDictEnumProcs inner = procs->nested(value);
                if (value)
                    value->enumerate(&inner, local);
            }
            break;
        }
        case ZYRPublic::kZYRValTypeArray: {
            I_Array* value = nullptr;
            if (array->get(i, &value, local)) {
                const CZYRArray nestedArray(value, false);
                head();
                if (value && procs->refuseToDescend(value))
                    break;
                ZYRDictEnumProcs inner = procs->nested(value);
                printArrayContents(&inner, value, local);
            }
            break;
        }
        case ZYRPublic::kZYRValTypeDataBuffer: {
            ZYRPublic::I_DataBuffer* value = nullptr;
            if (array->get(i, &value, local)) {
                const CZYRDataBuffer buffer(value, false);
                head();
                printDataBufferContents(value, local);
            }
            break;
        }
        }
    }
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, ZYRPublic::I_DataBuffer* value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << "[ZYRDataBuffer]: ";
        printDataBufferContents(value, err);
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, I_Array* value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRArray]: ";
        if (value && refuseToDescend(value))
            return;
        out_ << std::endl;
        ZYRDictEnumProcs inner = nested(value);
        printArrayContents(&inner, value, err);
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, I_Dict* value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRDict]: ";
        if (value && refuseToDescend(value))
            return;
        out_ << std::endl;
        ZYRDictEnumProcs inner = nested(value);
        if (value)
            value->enumerate(&inner, err);
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, I_UniString* value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRUniString]: ";
        printKey(value, err);
        out_ << std::endl;
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, bool value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRBool]: " << (value ? 1 : 0) << std::endl;
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, double value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRDouble]: " << value << std::endl;
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, unsigned int value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRUINT]: " << value << std::endl;
    });
}

bool ZYRDictEnumProcs::enumProc(I_UniString* key, int32_t value, I_Error& err) {
    return entry(key, [&] {
        printKey(key, err);
        out_ << " [ZYRINT]: " << value << std::endl;
    });
}

TracingEnumProcs::~TracingEnumProcs() = default;

bool TracingEnumProcs::enumProc(const CZYRUniString& key, const CZYRDataBuffer& value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, const CZYRArray& value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, const CZYRDict& value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, const CZYRUniString& value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, bool value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, double value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, unsigned int value) {
    target_.set(key, value);
    return true;
}
bool TracingEnumProcs::enumProc(const CZYRUniString& key, int32_t value) {
    target_.set(key, value);
    return true;
}

} // namespace ZYRStd
