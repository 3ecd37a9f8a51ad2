// Prints the page of hostile reports, for scripts/check-page to open in a browser.
#include <iostream>

#include "simulator/show/hostile_report.h"
#include "simulator/show/page.h"

using namespace simulator;

int main() {
  Page page({0, kHostileText});
  page.Add(HostileReport(kHostileText));
  page.Add(HostileReport(std::string(100'000, 'W')));
  std::cout << page.Html(3);
}
