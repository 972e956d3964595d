// Puts functions that call the observer of driver calls into a table of function pointers.
#pragma once

#include "qgf/DriverCall.h"

namespace QGF {
namespace Core {

// The function for one member of a table.
template <Interface kInterface, auto Member>
struct ObservedCall;

template <Interface kInterface, typename Table, typename Result, typename... Parameters,
          Result (*Table::*Member)(Parameters...)>
struct ObservedCall<kInterface, Member> {
    static inline Result (*gFunction)(Parameters...) = nullptr;

    static Result Call(Parameters... parameters)
    {
        const DriverCall call(kInterface);
        return gFunction(parameters...);
    }

    static void Insert(Table& table)
    {
        if (table.*Member == nullptr)
            return;
        gFunction = table.*Member;
        table.*Member = Call;
    }
};

// Makes the calls of this member observed. Only for the one table of a process: the function of an
// earlier one is forgotten. A null pointer stays null.
template <Interface kInterface, auto Member, typename Table>
void ObserveMember(Table& table)
{
    ObservedCall<kInterface, Member>::Insert(table);
}

} // namespace Core
} // namespace QGF
