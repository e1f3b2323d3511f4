/// \file
/// The element types of image and volume data.
#pragma once

#include <zmlib/ZmExport.h>

/// One of the ten element types of raw image data, as a stable type code: the codes are stored in
/// files and sent between processes, so they never change.
///
/// | code | `Type` | name | size | element |
/// |---|---|---|---|---|
/// | 0 | BYTE | "byte" | 1 | unsigned 8-bit |
/// | 1 | SHORT | "short" | 2 | signed 16-bit |
/// | 2 | INT | "int" | 4 | signed 32-bit |
/// | 3 | FLOAT | "float" | 4 | 32-bit float |
/// | 4 | DOUBLE | "double" | 8 | 64-bit float |
/// | 5 | COMPLEX | "complex" | 8 | real and imaginary 32-bit float |
/// | 6 | STRING | "string" | 8 | pointer to a character string |
/// | 7 | USHORT | "ushort" | 2 | unsigned 16-bit |
/// | 8 | UINT | "uint" | 4 | unsigned 32-bit |
/// | 9 | SBYTE | "sbyte" | 1 | signed 8-bit |
///
/// A plain value. The name and size tables are indexed by the code without a bounds test: a code
/// outside 0..9 gives undefined results there.
class ZMLIB_API ZmPrimType {
public:
    enum Type {
        BYTE = 0,
        SHORT = 1,
        INT = 2,
        FLOAT = 3,
        DOUBLE = 4,
        COMPLEX = 5,
        STRING = 6,
        USHORT = 7,
        UINT = 8,
        SBYTE = 9
    };

    /// "byte".
    ZmPrimType() noexcept = default;
    ZmPrimType(int code) noexcept : m_type(code) {}
    // The type of a pointer names the element; a plain char counts as signed.
    ZmPrimType(const char*) noexcept : m_type(SBYTE) {}
    ZmPrimType(const signed char*) noexcept : m_type(SBYTE) {}
    ZmPrimType(const unsigned char*) noexcept : m_type(BYTE) {}
    ZmPrimType(const short*) noexcept : m_type(SHORT) {}
    ZmPrimType(const unsigned short*) noexcept : m_type(USHORT) {}
    ZmPrimType(const int*) noexcept : m_type(INT) {}
    ZmPrimType(const unsigned int*) noexcept : m_type(UINT) {}
    ZmPrimType(const float*) noexcept : m_type(FLOAT) {}
    ZmPrimType(const double*) noexcept : m_type(DOUBLE) {}

    int operator=(int code) noexcept { return m_type = code; }
    int operator=(Type type) noexcept { return m_type = type; }
    bool operator==(int code) const noexcept { return m_type == code; }
    bool operator==(Type type) const noexcept { return m_type == int(type); }
    bool operator!=(int code) const noexcept { return m_type != code; }
    bool operator!=(Type type) const noexcept { return m_type != int(type); }
    operator int() const noexcept { return m_type; }
    int getType() const noexcept { return m_type; }

    /// The name from the table above.
    const char* getName() const noexcept { return primTypeName[m_type]; }
    /// Bytes per element.
    int size() const noexcept { return primTypeSize[m_type]; }

    /// Sets \p type to the code whose name equals \p name exactly (case matters); false, with
    /// \p type untouched, when no name matches.
    static bool nameToType(const char* name, Type& type) noexcept;

    /// "float", "double" and "complex".
    bool isFloat() const noexcept { return m_type == FLOAT || m_type == DOUBLE || m_type == COMPLEX; }
    /// The six integer types.
    bool isInteger() const noexcept
    {
        return m_type == BYTE || m_type == SHORT || m_type == INT || m_type == USHORT || m_type == UINT ||
               m_type == SBYTE;
    }
    /// Codes 1 to 5 and 9: "byte", "string", "ushort" and "uint" count as unsigned.
    bool isSigned() const noexcept { return (m_type >= SHORT && m_type <= COMPLEX) || m_type == SBYTE; }
    /// byte -> sbyte, ushort -> short, uint -> int; other types stay. Returns this type.
    ZmPrimType& makeSigned() noexcept;
    /// short -> ushort, int -> uint, sbyte -> byte; other types stay. Returns this type.
    ZmPrimType& makeUnsigned() noexcept;

    static const char* const primTypeName[10];
    static const int primTypeSize[10];

private:
    int m_type = BYTE;
};
