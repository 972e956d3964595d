#include "qgf/OCLFunctionTable.h"
#include "qgf/qgf_core/ObservedCalls.h"

namespace QGF {
namespace OCL {

namespace {

// Both return false if a required entry point is missing.
template <typename Function>
bool Fill(Function& member, Core::Proc proc)
{
    member = reinterpret_cast<Function>(proc);
    return proc != nullptr;
}

template <typename Function>
bool Fill(Uncalled<Function>& member, Core::Proc proc)
{
    member.address = reinterpret_cast<Function>(proc);
    return true;
}

} // namespace

bool FillFunctionTable(FunctionTable& table, Core::Proc (*getProc)(void* context, const char* name),
                       void* context)
{
    bool complete = true;

#define QGF_OCL_FILL(name) complete = Fill(table.name, getProc(context, #name)) && complete;
    QGF_OCL_ENTRY_POINTS(QGF_OCL_FILL, QGF_OCL_FILL)
#undef QGF_OCL_FILL

    return complete;
}

void ObserveCalls(FunctionTable& table)
{
#define QGF_OCL_OBSERVE(name)                                                                      \
    Core::ObserveMember<Core::Interface::kOpenCL, &FunctionTable::name>(table);
#define QGF_OCL_SKIP(name)
    QGF_OCL_ENTRY_POINTS(QGF_OCL_OBSERVE, QGF_OCL_SKIP)
#undef QGF_OCL_OBSERVE
#undef QGF_OCL_SKIP
}

} // namespace OCL
} // namespace QGF
