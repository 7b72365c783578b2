#include "Runtime/Testing/TestProperty.h"

#include <sstream>

namespace Testing
{
std::string FormatTestProperty(const TestProperty& property)
{
    std::ostringstream out;
    switch (property.type)
    {
        case TestProperty::kInt: out << property.intValue; break;
        case TestProperty::kLong: out << property.longValue; break;
        case TestProperty::kFloat: out << property.floatValue; break;
        case TestProperty::kDouble: out << property.doubleValue; break;
        case TestProperty::kString: out << property.stringValue; break;
    }
    return out.str();
}
}
