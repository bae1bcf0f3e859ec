// The span between the expert's Initialize and Uninitialize, in which items may be used.
#pragma once

#include "uxsys/Expert.h"

namespace kest::cfg {

class ExpertSession {
  public:
    // Calls Initialize; throws a failure with the status when it fails.
    explicit ExpertSession(IuxSysExpert3* expert);
    // Calls Uninitialize, which also waits for work the expert deferred (a network restart).
    ~ExpertSession();
    ExpertSession(const ExpertSession&) = delete;
    ExpertSession& operator=(const ExpertSession&) = delete;

  private:
    IuxSysExpert3* expert_;
};

}  // namespace kest::cfg
