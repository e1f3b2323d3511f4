/// \file
/// The base of the library's few exceptions.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <exception>

/// An exception carrying a message text.
///
/// The library throws only on allocation failure (`ZmMemoryException`) and from explicit
/// `raise()`/`ZmResult::throwOnFail()`. `clone()` and `raise()` let code that holds an exception by
/// base pointer copy and rethrow it. Derives from `std::exception`, so generic handlers see the
/// message through `what()`. Not shared between threads.
class ZMLIB_API ZmException : public std::exception {
public:
    /// The message formatted as by `ZmString::printf`.
    explicit ZmException(const char* fmt, ...) ZMLIB_PRINTF(2, 3);
    /// A copy of \p message.
    explicit ZmException(ZmString& message);
    /// Copies the message; an exception holding no message memory is copied without allocating.
    ZmException(const ZmException& other);
    ZmException& operator=(const ZmException& other);
    ~ZmException() override;

    /// The message text.
    const char* what() const noexcept override;

    /// A new copy made by the virtual `doClone()`; the caller owns it.
    ZmException* clone() const;

    /// Throws through the virtual `doRaise()`. What leaves `raise()` is always a plain
    /// `ZmException` copy: a subclass thrown by `doRaise()` is caught and rethrown as the base type
    /// on purpose, because handlers of rethrown exceptions only ever catch the base.
    [[noreturn]] void raise() const;

protected:
    /// An empty message.
    ZmException();
    struct NoAllocation {};
    /// An empty message that holds no memory, so that the exception of a failed allocation can be
    /// built and copied while the heap refuses every request. `what()` gives the empty text.
    explicit ZmException(NoAllocation) noexcept;

    /// Returns a new `ZmException` copy of this object.
    virtual ZmException* doClone() const;
    /// Throws a `ZmException` copy of this object.
    [[noreturn]] virtual void doRaise() const;

    mutable ZmString m_message;
};
