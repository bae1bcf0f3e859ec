// The polymorphic root of every component object of the library.
#pragma once

class CVQComObjectRootBase {
  public:
    CVQComObjectRootBase(const CVQComObjectRootBase&) = delete;
    CVQComObjectRootBase& operator=(const CVQComObjectRootBase&) = delete;
    virtual ~CVQComObjectRootBase() = default;

  protected:
    CVQComObjectRootBase() = default;
};
