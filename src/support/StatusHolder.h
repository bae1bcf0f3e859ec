// A holder for the result of a sequence of status-returning calls: the first failure aborts the
// sequence by travelling as a thrown status (a long) to the nearest guard.
#pragma once

#include "uxsys/Types.h"

class StatusHolder {
  public:
    StatusHolder() = default;

    // Stores `status`; a negative status is then thrown as a long.
    StatusHolder& operator=(HRESULT status) {
        status_ = status;
        if (status < 0) {
            throw static_cast<long>(status);
        }
        return *this;
    }

    // The last status stored.
    HRESULT Get() const { return status_; }

  private:
    HRESULT status_ = 0;
};
