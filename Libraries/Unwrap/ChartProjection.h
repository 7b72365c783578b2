// A chart's bounding box, as the box packer takes it.
#pragma once

#include "UnwrapMath.h"

#include <stdint.h>

struct ChartBox
{
    double width;    // width >= height
    double height;
};
