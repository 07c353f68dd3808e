#include "lsc/processing_context.h"
