#include <korvane/serialization/KVIgnoreElement.h>

KVIgnoreElement::~KVIgnoreElement() = default;

KVIgnoreElement& KVIgnoreElement::sharedInstance()
{
    static KVIgnoreElement instance;
    return instance;
}
