/// \file
/// A raw pointer with its element type.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmPrimType.h>

/// A raw pointer with the type of the elements it points to. Passed by value; owns nothing.
class ZMLIB_API ZmTypedPointer {
public:
    ZmTypedPointer() noexcept = default;
    ZmTypedPointer(void* data, ZmPrimType type) noexcept : m_data(data), m_type(type) {}
    ZmTypedPointer(char* p) noexcept : m_data(p), m_type(ZmPrimType::SBYTE) {}
    ZmTypedPointer(signed char* p) noexcept : m_data(p), m_type(ZmPrimType::SBYTE) {}
    ZmTypedPointer(unsigned char* p) noexcept : m_data(p), m_type(ZmPrimType::BYTE) {}
    ZmTypedPointer(short* p) noexcept : m_data(p), m_type(ZmPrimType::SHORT) {}
    ZmTypedPointer(unsigned short* p) noexcept : m_data(p), m_type(ZmPrimType::USHORT) {}
    ZmTypedPointer(int* p) noexcept : m_data(p), m_type(ZmPrimType::INT) {}
    ZmTypedPointer(unsigned int* p) noexcept : m_data(p), m_type(ZmPrimType::UINT) {}
    ZmTypedPointer(float* p) noexcept : m_data(p), m_type(ZmPrimType::FLOAT) {}
    ZmTypedPointer(double* p) noexcept : m_data(p), m_type(ZmPrimType::DOUBLE) {}

    void* data() const noexcept { return m_data; }
    operator void*() const noexcept { return m_data; }
    ZmPrimType primType() const noexcept { return m_type; }
    void primTypeSet(const ZmPrimType& type) noexcept { m_type = type; }
    bool isNull() const noexcept { return m_data == nullptr; }
    bool isNotNull() const noexcept { return m_data != nullptr; }

private:
    void* m_data = nullptr;
    ZmPrimType m_type;
};
