// Late-bound calls of a dual interface, by the description that our type library has of it.
#pragma once

#include "platform/windows/WindowsHeaders.h"

#include <oleauto.h>

namespace tarnwick {

// Calls the member as IDispatch::Invoke says. Unlike the system's own function it also takes what script
// hosts pass for a typed by-reference parameter: a reference to a VARIANT of another type, which receives the
// changed value, or a plain value, whose change is lost. Runs whatever code the member runs. Throws
// std::bad_alloc.
HRESULT InvokeMember(ITypeInfo& description, void* object, DISPID member, WORD flags, DISPPARAMS* arguments,
                     VARIANT* result, EXCEPINFO* exception, UINT* argumentError);

}  // namespace tarnwick
