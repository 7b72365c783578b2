#include "Runtime/Testing/TestAttributes.h"

namespace TestAttributes
{
const BaseAttribute* BaseAttribute::GetAttribute(Type type, const Testing::Test* test)
{
    for (const Testing::TestAttribute* attribute : test->Attributes())
    {
        // Every attribute the harness hands out is a BaseAttribute; anything else is skipped.
        const BaseAttribute* known = dynamic_cast<const BaseAttribute*>(attribute);
        if (known != nullptr && known->attributeType == type)
            return known;
    }
    return nullptr;
}
}
