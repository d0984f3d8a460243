#include "catalog/FolderTree.h"

#include <gtest/gtest.h>
