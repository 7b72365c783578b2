#include "Editor/Tools/Quillet/quillet_PELoader.h"
