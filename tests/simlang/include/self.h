#include <self.h>
