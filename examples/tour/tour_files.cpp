#include "tour.h"

void TourFiles() {}
