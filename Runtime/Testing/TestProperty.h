#pragma once
// A typed value that a running test reports about itself (a vertex count, a time), printed by
// the console reporter after the test's elapsed time, in name order.

#include <string>

namespace Testing
{
    struct TestProperty
    {
        enum Type
        {
            kInt = 0,
            kLong = 1,
            kFloat = 2,
            kDouble = 3,
            kString = 4
        };

        TestProperty() : type(kInt), intValue(0) {}
        TestProperty(int value) : type(kInt), intValue(value) {}
        TestProperty(long value) : type(kLong), longValue(value) {}
        TestProperty(float value) : type(kFloat), floatValue(value) {}
        TestProperty(double value) : type(kDouble), doubleValue(value) {}
        TestProperty(const char* value) : type(kString), longValue(0), stringValue(value ? value : "") {}
        TestProperty(const std::string& value) : type(kString), longValue(0), stringValue(value) {}

        Type type;
        union
        {
            int intValue;
            long longValue;
            float floatValue;
            double doubleValue;
        };
        std::string stringValue;
    };

    // The value as the reporter prints it: integers in decimal, floating point in the default
    // stream notation, strings as they are.
    std::string FormatTestProperty(const TestProperty& property);
}
