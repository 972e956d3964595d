#include "facts/Environment.h"
#include "facts/FileVersion.h"
#include "identity/Identity.h"

namespace assay_host {

Identity GetIdentity(const std::string& assayProgram)
{
    Identity identity;
    const Environment environment = GetEnvironment(false);
    identity.fSystem = environment.fSystem.fValue + "; " + environment.fBuild.fValue + "; " +
                       environment.fKernel.fValue + "; " + environment.fArchitecture.fValue;
    identity.fAssayVersion = GetFileVersion(assayProgram).fValue;
    SortIdentity(identity);
    return identity;
}

} // namespace assay_host
