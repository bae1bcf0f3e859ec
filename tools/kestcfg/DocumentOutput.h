// Standard output with --json: kept for the one JSON document of the run. While the plug-in
// runs, descriptor 1 points at standard error, so that nothing the plug-in writes there (its
// tracing may be configured to standard output) can break the document.
#pragma once

#include <string>

#include "support/FileDescriptor.h"

namespace kest::cfg {

class DocumentOutput {
  public:
    // With `keep`, moves standard output aside and points descriptor 1 at standard error.
    explicit DocumentOutput(bool keep);
    DocumentOutput(const DocumentOutput&) = delete;
    DocumentOutput& operator=(const DocumentOutput&) = delete;

    // Writes `text` whole to the real standard output.
    void Write(const std::string& text);

  private:
    kest::FileDescriptor descriptor_;  // the real standard output when it was moved aside
};

}  // namespace kest::cfg
