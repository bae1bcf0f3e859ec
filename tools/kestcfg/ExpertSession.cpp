#include "ExpertSession.h"

#include "ExitCodes.h"
#include "StatusNames.h"

namespace kest::cfg {

ExpertSession::ExpertSession(IuxSysExpert3* expert) : expert_(expert) {
    const HRESULT status = expert_->Initialize();
    if (status < 0) {
        throw Failure("Initialize failed with " + StatusWithName(status));
    }
}

ExpertSession::~ExpertSession() {
    expert_->Uninitialize();
}

}  // namespace kest::cfg
