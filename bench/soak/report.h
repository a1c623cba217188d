// A soak run as a page with a plot of each quantity.
#pragma once

#include <string>
#include <vector>

#include "bench/soak/samples.h"

namespace bench {

std::string soakPage(const std::string& title, const std::vector<Sample>& samples);

}  // namespace bench
