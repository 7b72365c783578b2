#pragma once
// Attributes a test can carry. Declare them on a test with TEST_WITH_ATTRIBUTES (Testing.h):
//     TEST_WITH_ATTRIBUTES(Name, TestAttributes::KnownFailure(123, "flaky"), TestAttributes::IgnoreExtraLogOutput())
// KnownFailure and NotYetImplemented make the filter skip the test and list it as ignored;
// IgnoreExtraLogOutput marks a test whose extra log output is expected. The two C# resource kinds
// are carried for completeness; nothing in this system reads them.

#include "Runtime/Testing/HarnessTest.h"

namespace TestAttributes
{
    class BaseAttribute : public Testing::TestAttribute
    {
    public:
        enum Type
        {
            kKnownFailure = 0,
            kNotYetImplemented = 1,
            kIgnoreExtraLogOutput = 2,
            kCompiledCSharpResource = 3,
            kExternalCSharpResource = 4
        };

        explicit BaseAttribute(Type type) : attributeType(type) {}

        // A new copy of this attribute, owned by the caller.
        virtual BaseAttribute* Clone() const = 0;

        // The first attribute of the given type in the test's list, or null.
        static const BaseAttribute* GetAttribute(Type type, const Testing::Test* test);
        static bool HasAttribute(Type type, const Testing::Test* test) { return GetAttribute(type, test) != nullptr; }

        Type attributeType;
    };

    // Implements Clone for each attribute class.
    template <class Derived, BaseAttribute::Type TypeValue>
    class AttributeOfType : public BaseAttribute
    {
    public:
        static constexpr Type kType = TypeValue;
        AttributeOfType() : BaseAttribute(TypeValue) {}
        BaseAttribute* Clone() const override { return new Derived(static_cast<const Derived&>(*this)); }
    };

    class KnownFailure : public AttributeOfType<KnownFailure, BaseAttribute::kKnownFailure>
    {
    public:
        explicit KnownFailure(int bug = 0, const char* why = nullptr) : bugNumber(bug), reason(why) {}
        int bugNumber;
        const char* reason;
    };

    class NotYetImplemented : public AttributeOfType<NotYetImplemented, BaseAttribute::kNotYetImplemented>
    {
    public:
        explicit NotYetImplemented(const char* why = nullptr) : reason(why) {}
        const char* reason;
    };

    class IgnoreExtraLogOutput : public AttributeOfType<IgnoreExtraLogOutput, BaseAttribute::kIgnoreExtraLogOutput>
    {
    };

    class CompiledCSharpResource : public AttributeOfType<CompiledCSharpResource, BaseAttribute::kCompiledCSharpResource>
    {
    public:
        explicit CompiledCSharpResource(const char* source = nullptr) : code(source) {}
        const char* code;
    };

    class ExternalCSharpResource : public AttributeOfType<ExternalCSharpResource, BaseAttribute::kExternalCSharpResource>
    {
    public:
        explicit ExternalCSharpResource(const char* path = nullptr) : filePath(path) {}
        const char* filePath;
    };
}

namespace Testing
{
    // Appends a copy of each attribute to `list`; the expansion of TEST_WITH_ATTRIBUTES.
    template <class... Attributes>
    void AppendAttributes(TestAttributeList& list, const Attributes&... attributes)
    {
        (void)list;  // unused when the test has no attributes
        (list.push_back(attributes.Clone()), ...);
    }
}
