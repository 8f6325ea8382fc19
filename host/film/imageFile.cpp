#include "film/imageFile.h"
