#include "tour.h"

void TourUtil() {}
