// A page that shows what a registration found: one file, which needs nothing else and no network.
#ifndef KEL_EXAMPLES_REPORT_H
#define KEL_EXAMPLES_REPORT_H

#include <string>
#include <utility>
#include <vector>

#include "Picture.h"

namespace kel_examples {

struct Report {
    std::string command;                                        // as it was typed
    std::string verdict;                                        // one sentence
    std::vector<std::pair<std::string, std::string>> facts;     // name and value
    const Image* second = nullptr;                              // to swipe over; null where nothing was found
    const Image* warped = nullptr;                              // the first picture in the second's frame
    std::vector<std::pair<std::string, const Image*>> pictures; // title and picture
};

void writeReport(const std::string& path, const Report& report);

} // namespace kel_examples

#endif
