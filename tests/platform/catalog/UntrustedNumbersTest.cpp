#include "FolderIndexFixture.h"
