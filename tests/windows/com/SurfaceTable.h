// What hosts were promised: classes, interfaces and events. The enumerations stand in the reference.
#pragma once

namespace tarnwick::test {

// One line for each member, in the order of its interface, below the line of what it belongs to:
//
//   class NAME [creatable] [control] default INTERFACE [events INTERFACE]
//   interface NAME         with lines  PROPERTY: TYPE  and  METHOD(PARAMETER, ...): RESULT
//   events NAME            with lines  NUMBER EVENT(PARAMETER, ...)
//
// Lines below two names, parted by a comma, are of both of them, or of the control that is named in front.
// A parameter is [optional] [ref] NAME: TYPE [= DEFAULT]; every property can be read and set.
extern const char* const kSurface;

}  // namespace tarnwick::test
