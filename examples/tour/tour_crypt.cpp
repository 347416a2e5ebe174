#include "tour.h"

void TourCrypt() {}
