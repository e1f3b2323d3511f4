/// \file
/// Operations on untyped buffers of image and volume elements.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmPrimType.h>
#include <zmlib/ZmTypedPointer.h>

#include <cstdint>
#include <cstdio>

class ZmProgressInterface;

/// Fill, convert, rescale, measure, byte-swap, transpose, crop, flip, down-sample, read and write
/// buffers of `ZmPrimType` elements.
///
/// Counts are elements, not bytes, unless a function says otherwise. Volumes are dense with x
/// fastest. Every element loop is written per type (or per type pair) without per-element
/// dispatch. Nothing throws: unsupported types and failed input/output are written to the log
/// (`getTheLogInstance()`) and leave the destination untouched; `flip`, `crop` and `swapDims`
/// answer failure by their result and leave their input as it was. The functions keep no state:
/// any number of threads may call them on different buffers.
namespace ZmRawData {

/// Fills \p n elements with \p value: its low bits for "byte", "short" and "ushort", all its bits
/// for "int", the converted value for "float" and "double". Any other type (also "uint" and
/// "sbyte") logs "Unsupported data type %s in ZmRawData::memset()".
ZMLIB_API void memset(ZmTypedPointer p, int value, int64_t n);
/// The floating-point fill: "byte", "short", "int" and "ushort" get floor(value + 0.5) (limited to
/// the int range first) through the integer fill; "float" and "double" get the value; other types
/// log as the integer fill does.
ZMLIB_API void memset(ZmTypedPointer p, double value, int64_t n);

/// Copies \p n elements from \p src to \p dst, converting each to the destination's type.
/// - The same type on both sides: a plain copy of the bytes (any type).
/// - "complex" on either side otherwise: logs "ERROR: ZmRawData::memcpy(), complex data are not
///   supported" and copies nothing.
/// - A "uint" or "sbyte" destination: logs "Unsupported data type %s in ZmRawData()" and copies
///   nothing.
/// - "string" on either side otherwise: nothing happens.
/// - Otherwise every numeric source type converts to "byte", "short", "int", "float", "double" and
///   "ushort": integers saturate at the destination's range; float and double values are clamped
///   to the destination's range and truncated toward zero, NaN becomes 0; integers convert to
///   float and double as C++ converts them, and so do float and double into each other.
ZMLIB_API void memcpy(ZmTypedPointer dst, ZmTypedPointer src, int64_t n);

/// dst = (src + offset) * scale for \p n elements, in single precision: offset and scale are
/// rounded to float, each source value is converted to float. Integer destinations get the result
/// clamped to their range and truncated toward zero (NaN gives 0); a "float" destination stores it
/// unclamped, a "double" destination stores the float result widened. Every numeric type works on
/// both sides. "complex" to "complex" maps the 2n floats (real and imaginary parts alike); a real
/// source into "complex" sets the real parts and zeroes the imaginary ones; "complex" into a real
/// type logs "ERROR: ZmRawData::mapLinear(), mapping from complex to real is not supported" and
/// does nothing. A "string" side logs "Unsupported data type %s in ZmRawData::mapLinear()".
ZMLIB_API void mapLinear(ZmTypedPointer dst, ZmTypedPointer src, uint64_t n, double offset, double scale);

/// The smallest and largest of \p n values, converted to float, for "byte", "short", "int",
/// "float", "double", "complex" (the 2n floats, real and imaginary parts alike) and "ushort".
/// Both start at the first element, which is read even when \p n is 0 (but never through a null
/// pointer); NaN after the first element is passed over, a NaN first element stays. Of zeros of
/// both signs either may be reported. Other types write nothing.
ZMLIB_API void getRange(ZmTypedPointer p, uint64_t n, float& min, float& max);
/// Whether all \p n values are equal, over the types of `getRange` with its comparisons (floats
/// compare exactly, NaN after the first value is passed over); true for n = 0, false for other
/// types. Returns at the first block of values that holds a difference.
ZMLIB_API bool isConstant(ZmTypedPointer p, uint64_t n);

/// Reverses the byte order of each of \p n elements, chosen by element size: nothing for 1 byte;
/// 16-bit and 32-bit words; "double" as 64-bit words, the other 8-byte types ("complex", "string")
/// as 2n 32-bit words. Other sizes log the warning "Swapping of %d-byte words not supported.".
ZMLIB_API void swapBytes(ZmTypedPointer p, uint64_t n);
/// Byte reversal of \p n 2-, 4- and 8-byte words; \p p needs no alignment.
ZMLIB_API void swapBytesWord2(void* p, uint64_t n);
ZMLIB_API void swapBytesWord4(void* p, uint64_t n);
ZMLIB_API void swapBytesWord8(void* p, uint64_t n);

/// Element input and output in a given byte order (the machine's is little-endian). Each returns
/// the number of whole elements transferred. `writeBigEndian` swaps, writes and swaps back: the
/// caller's buffer is unchanged afterwards (but not while it writes).
ZMLIB_API uint64_t readBigEndian(ZmTypedPointer p, uint64_t n, FILE* f);
ZMLIB_API uint64_t readLittleEndian(ZmTypedPointer p, uint64_t n, FILE* f);
ZMLIB_API uint64_t writeBigEndian(ZmTypedPointer p, uint64_t n, FILE* f);
ZMLIB_API uint64_t writeLittleEndian(ZmTypedPointer p, uint64_t n, FILE* f);

/// Reads \p elemSize * \p n bytes in chunks of at most 1 MiB, stopping at the first short chunk;
/// returns the whole elements read (0 for an element size of 0).
ZMLIB_API uint64_t fread(void* buf, uint64_t elemSize, uint64_t n, FILE* f);
/// Writes the bytes as whole 1 MiB chunks, stopping at a short one, then the rest in one call;
/// returns the whole elements written (0 for an element size of 0).
ZMLIB_API uint64_t fwrite(void* buf, uint64_t elemSize, uint64_t n, FILE* f);

/// Reads up to \p size bytes from the descriptor, in chunks of at most 4 MiB with
/// \p limitChunks, else of at most 4294967295 bytes; stops at the end of the input or at a
/// failure, which logs "ZmRawData::read() failed, ret=%lld, size=%lld, errno=%d (%s)". An
/// interrupted call (EINTR) is repeated. Returns the bytes read (0 for size < 1).
ZMLIB_API int64_t read(int fd, void* buf, int64_t size, bool limitChunks);
/// Writes all \p size bytes (an interrupted call is repeated); returns \p size, or
/// uint64_t(-1) when a write fails.
ZMLIB_API uint64_t write(int fd, const void* buf, uint64_t size);

/// Permutes the axes of the volume at \p p (dims[0] x dims[1] x dims[2] voxels of \p nComponents
/// values of p's type) in place: new axis i is old axis perm[i], and \p dims becomes
/// (dims[perm[0]], dims[perm[1]], dims[perm[2]]).
/// - perm (0, 1, 2): true at once. A constant volume: only \p dims is rewritten.
/// - Voxels move whole. "byte", "short", "ushort", "int", "float" and "double" work with any
///   number of components, and so does any voxel of 4 bytes in all; other types log
///   "Unsupported data type %s in ZmRawData::swapDims()" and give false.
/// - Extra memory: at most one bit per voxel (one per line along the shortest axis) and a scratch
///   block of max(2, middle extent) lines of the longest extent. When either cannot be allocated:
///   false, data unchanged. The voxels move by plane and line transpositions, close to the speed
///   of a copy into a second buffer.
/// - A null pointer, a dim below 1, fewer than 1 component or a \p perm that is not a permutation
///   of 0, 1, 2: false, nothing touched.
ZMLIB_API bool swapDims(ZmTypedPointer p, int dims[3], const int perm[3], int nComponents);

/// Replaces the volume \p data (from `zmmalloc`; dims[0] x dims[1] x dims[2] elements of
/// \p elemSize bytes) by the box \p boxMin..\p boxMax (inclusive voxel indices, which may reach
/// outside the volume: the box may enlarge it). Voxels of the box outside the volume get the
/// element at \p fillValue (zeros when it is null). The old block is freed with `zmfree`, \p data
/// and \p dims describe the new one. Returns 1 on success or when the box is the whole volume (no
/// work); 0 for an element size or dim below 1, a null \p data, an empty box (boxMax below boxMin
/// on an axis) or a failed allocation, with everything unchanged.
ZMLIB_API int crop(void*& data, int elemSize, int dims[3], const int boxMin[3], const int boxMax[3],
                   const void* fillValue);

/// Mirrors the volume along \p axis in place, with one line of scratch memory. Returns 1 on
/// success and when dims[axis] is 1 (no work); 0 for an axis outside 0..2, a dim or element size
/// below 1, a null pointer or a failed allocation of the scratch line, with the data unchanged.
ZMLIB_API int flip(void* data, int elemSize, const int dims[3], int axis);

/// Block means: \p dst (the type of \p src) receives floor(nx/bx) x floor(ny/by) x floor(nz/bz)
/// elements, each the mean of its bx*by*bz source elements; incomplete blocks at the upper ends
/// are dropped. Float input is summed in float, double in double, each in z, y, x order; integer
/// input is summed exactly and divided by the block size with truncation toward zero. Types:
/// "byte", "short", "int", "float", "double", "ushort"; others log "Unsupported data type %s in
/// ZmRawData::downSample3D". Block sizes below 1 do nothing.
///
/// With \p progress: one task for the whole run, one step per output slice (a `ProgressScope`
/// closes it on every way out); a cancellation stops after the current output slice, leaving the
/// slices not reached as they were.
ZMLIB_API void downSample3D(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny, uint64_t nz, int bx,
                            int by, int bz, ZmProgressInterface* progress);
/// `downSample3D` for \p nComponents interleaved values per voxel, each component on its own.
ZMLIB_API void downSample3DN(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny, uint64_t nz, int bx,
                             int by, int bz, int nComponents, ZmProgressInterface* progress);
/// Label volumes: each output voxel is the label found most often in its block, the lowest such
/// label on a tie. Integer types only ("byte", "short", "int", "ushort", "uint", "sbyte"); others
/// log "Unsupported data type %s in ZmRawData::downSampleLabels3D".
ZMLIB_API void downSampleLabels3D(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny, uint64_t nz,
                                  int bx, int by, int bz, ZmProgressInterface* progress);
/// Each output value is the largest value of its component in the block (NaN after the first
/// value of a block is passed over). Every numeric type; others log "Unsupported data type %s in
/// ZmRawData::downSampleMaxFilterComponents3DN".
ZMLIB_API void downSampleMaxFilterComponents3DN(void* dst, ZmTypedPointer src, uint64_t nx, uint64_t ny,
                                                uint64_t nz, int bx, int by, int bz, int nComponents,
                                                ZmProgressInterface* progress);

} // namespace ZmRawData
