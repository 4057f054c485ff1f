#pragma once

#include "zverr/raisingSites.h"

#include <exception>

namespace zverr {

// Carries a whole status up the stack. Thrown is always an Exception; handlers may also name
// ExceptionBase or std::exception, and see the same what(): the payload text.
class ExceptionBase
{
public:
    ExceptionBase() noexcept;
    ExceptionBase(const ExceptionBase& other) noexcept;
    ExceptionBase& operator=(const ExceptionBase&) = delete;
    virtual ~ExceptionBase() noexcept;

    virtual const char* what() const noexcept;

    // Owned. Mutable because a copy takes the payload away from its source, which keeps the code:
    // so the throw of a local object hands its buffer on and copies no text.
    mutable zverr_Status status;
};

class Exception : public virtual ExceptionBase, public virtual std::exception
{
public:
    Exception() noexcept = default;
    Exception(const Exception& other) noexcept;
    Exception& operator=(const Exception&) = delete;
    ~Exception() noexcept override;

    const char* what() const noexcept override;
};

// Raises a failure of the plug-in's own, with the payload of its site.
[[noreturn]] void raise(const zverr_RaisingSite& site);

} // namespace zverr
