#include "property/PropertyValue.h"

#include <new>

CvqBStrHolder CopyHostString(const wchar_t* source) {
    CvqBStrHolder copy(CvqBStrAllocLen(source, CvqBStrLength(source)));
    if (copy.Get() == nullptr) {
        throw std::bad_alloc();
    }
    return copy;
}

std::unique_ptr<CuxPropertyValue> CuxTemplatePropertyValue<CvqBStr>::Copy() const {
    return std::make_unique<CuxTemplatePropertyValue>(CopyHostString(value_.Get()));
}
