// One stop of the tour per subsystem.
#ifndef TESSALINE_EXAMPLES_TOUR_H
#define TESSALINE_EXAMPLES_TOUR_H

void TourUtil();
void TourConfig();
void TourFiles();
void TourCrypt();
void TourThread();
void TourTree();

#endif
