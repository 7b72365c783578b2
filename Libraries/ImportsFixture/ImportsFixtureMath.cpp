// The math imports, including the __libm_sse2_* entries called the ordinary way (argument and
// result in xmm0); ImportsFixtureRegisters.cpp calls them with nothing but xmm0 set.
#include "ImportsFixture.h"

namespace
{
    bool Close(double actual, double expected)
    {
        double difference = actual - expected;
        return difference < 1e-12 && difference > -1e-12;
    }

    int CheckElementary()
    {
        FIXTURE_CHECK(Close(sin(0.5), 0.479425538604203) && Close(cos(0.5), 0.8775825618903728));
        FIXTURE_CHECK(Close(tan(0.5), 0.5463024898437905));
        FIXTURE_CHECK(Close(asin(0.5), 0.5235987755982989) && Close(acos(0.5), 1.0471975511965979));
        FIXTURE_CHECK(Close(atan(1.0), 0.7853981633974483) && Close(atan2(1.0, -1.0), 2.356194490192345));
        FIXTURE_CHECK(Close(sinh(1.0), 1.1752011936438014) && Close(cosh(1.0), 1.5430806348152437));
        FIXTURE_CHECK(Close(tanh(0.5), 0.46211715726000974));
        FIXTURE_CHECK(Close(exp(1.0), 2.718281828459045) && Close(log(10.0), 2.302585092994046));
        FIXTURE_CHECK(pow(2.0, 10.0) == 1024.0 && powf(3.0f, 2.0f) == 9.0f);
        FIXTURE_CHECK(Close(sqrt(2.0), 1.4142135623730951) && sqrtf(6.25f) == 2.5f);
        FIXTURE_CHECK(fmod(7.5, 2.0) == 1.5);
        return 0;
    }

    int CheckRounding()
    {
        FIXTURE_CHECK(floor(-2.5) == -3.0 && ceil(-2.5) == -2.0 && floorf(2.5f) == 2.0f);
        double whole = 0;
        FIXTURE_CHECK(modf(3.25, &whole) == 0.25 && whole == 3.0);
        int exponent = 0;
        FIXTURE_CHECK(frexp(8.0, &exponent) == 0.5 && exponent == 4);
        FIXTURE_CHECK(fabs(-3.0) == 3.0 && Fixture::BitsOf(fabs(-0.0)) == 0);
        return 0;
    }

    int CheckClassification()
    {
        volatile double zero = 0.0;
        double infinity = 1.0 / zero;
        double nan = zero / zero;
        FIXTURE_CHECK(_finite(1.7976931348623157e308) == 1 && _finite(infinity) == 0 && _finite(nan) == 0);
        FIXTURE_CHECK(_isnan(nan) == 1 && _isnan(infinity) == 0);
        FIXTURE_CHECK(_fpclass(-0.0) == 0x0020 && _fpclass(1.0) == 0x0100);
        FIXTURE_CHECK(_fpclass(5e-324) == 0x0080 && _fpclass(-infinity) == 0x0004 && _fpclass(nan) == 0x0002);
        return 0;
    }

    int CheckLibmSse2()
    {
        FIXTURE_CHECK(Close(__libm_sse2_sin(0.5), 0.479425538604203));
        FIXTURE_CHECK(Close(__libm_sse2_cos(0.5), 0.8775825618903728));
        FIXTURE_CHECK(Close(__libm_sse2_asin(0.5), 0.5235987755982989));
        FIXTURE_CHECK(Close(__libm_sse2_acos(0.5), 1.0471975511965979));
        FIXTURE_CHECK(Close(__libm_sse2_log(10.0), 2.302585092994046));
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestMath()
{
    if (int line = CheckElementary())
        return line;
    if (int line = CheckRounding())
        return line;
    if (int line = CheckClassification())
        return line;
    return CheckLibmSse2();
}
