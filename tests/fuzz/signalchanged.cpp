#include "content.h"

void Content::signalChanged(int)
{
}
