#include "tour.h"

void TourConfig() {}
