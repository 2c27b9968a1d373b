// LSLiteral basics: type names, the value exception, the error raisers, length and assignment.
#include "ovmacro/expr/literal.h"

#include "ovmacro/foundations/stream.h"

namespace orvan {

const char* TypeToString(ELiteral type) {
    switch (type) {
        case LT_UNDEF:
            return "undef";
        case LT_VOID:
            return "void";
        case LT_BOOL:
            return "bool";
        case LT_INT64:
            return "int64";
        case LT_FLOAT64:
            return "float64";
        case LT_CHAR:
            return "char";
        case LT_STRING:
            return "string";
    }
    // Only a corrupted value can get here; name it rather than crash while reporting another error.
    return "invalid type";
}

void LiteralException::Write(xostream& os) const {
    os << message_;
}

void ThrowNoConversion(const char* from, const char* to) {
    StringStream ss(4096);
    ss << "No conversion from " << from << " to " << to;
    throw LiteralException(ss.GetString());
}

void ThrowNoConversion(ELiteral from, const char* to) {
    ThrowNoConversion(TypeToString(from), to);
}

void ThrowNoImplicitConversion(const char* from, const char* to) {
    StringStream ss(4096);
    ss << "No implicit conversion from " << from << " to " << to;
    throw LiteralException(ss.GetString());
}

void ThrowNoImplicitConversion(ELiteral from, const char* to) {
    ThrowNoImplicitConversion(TypeToString(from), to);
}

template <class T>
void ThrowNoImplicitConversionFromValue(const T& v, const char* to) {
    StringStream ss(4096);
    ss << "No implicit conversion from value " << v << " to " << to;
    throw LiteralException(ss.GetString());
}

template void ThrowNoImplicitConversionFromValue<int64>(const int64&, const char*);
template void ThrowNoImplicitConversionFromValue<basic_xstring>(const basic_xstring&, const char*);

void ThrowIncompatibleTypeException(const LSLiteral& x, const char* op) {
    StringStream ss(4096);
    ss << "Incompatible type (" << TypeToString(x.GetType()) << ") for unary " << op << " operation";
    throw LiteralException(ss.GetString());
}

void ThrowIncompatibleTypesException(const LSLiteral& x, const LSLiteral& y, const char* op) {
    StringStream ss(4096);
    ss << "Incompatible types (" << TypeToString(x.GetType()) << " and " << TypeToString(y.GetType())
       << ") for " << op << " operation";
    throw LiteralException(ss.GetString());
}

int64 LSLiteral::GetLength() const {
    if (type_ == LT_STRING) return static_cast<int64>(string_.size());
    StringStream ss(4096);
    ss << "len() not available on " << TypeToString(type_);
    throw LiteralException(ss.GetString());
}

void LSLiteral::Assign(const LSLiteral& /*value*/) const {
    StringStream ss(4096);
    ss << "Can't assign to " << TypeToString(type_);
    if (type_ != LT_UNDEF && type_ != LT_VOID) ss << " r-value";
    throw LiteralException(ss.GetString());
}

}  // namespace orvan
