#include "Catalogue.h"

namespace FaultTest {

const std::string WORDS = "results (go forward)";
const std::string NO_WORDS = "results (none)";
const std::string NETWORK_ERROR = "error ErrorNetwork";

void PrintTo(const Fault& fault, std::ostream* out) {
    *out << fault.what;
}

const std::vector<Chapter>& getCatalogue() {
    static const std::vector<Chapter> CHAPTERS = {makeConnectionFaults(), makeAnswerFaults(),
                                                  makeStatusFaults(),     makeHeaderFaults(),
                                                  makeDocumentFaults(),   makeNetworkFaults()};
    return CHAPTERS;
}

}  // namespace FaultTest
