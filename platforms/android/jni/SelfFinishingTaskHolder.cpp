#include "SelfFinishingTaskHolder.h"

#include <algorithm>
#include <boost/make_shared.hpp>

#include "pal/kd_log.h"

void SelfFinishingTaskHolder::submitLog(
    Talvox::Talvox& facade, const boost::shared_ptr<Talvox::RecognizeRequest>& request) {
    const auto holder = boost::make_shared<SelfFinishingTaskHolder>();
    SelfFinishingTaskHolder* const target = holder.get();
    request->callback = [target](const boost::shared_ptr<const Talvox::RecognitionResults>& results,
                                 const std::string& text) { target->selfFinish(results, text); };
    holder->submitNoRetries(request);
    // Nothing of it is delivered before the event lock is free; what throws here ends it.
    facade.runningTaskHolders.push_back(holder);
}

void SelfFinishingTaskHolder::selfFinish(
    const boost::shared_ptr<const Talvox::RecognitionResults>& results,
    const std::string& /*text*/) {
    const boost::shared_ptr<SelfFinishingTaskHolder> self = shared_from_this();
    onFinished();
    kdLogFormatMessage("SelfFinishingTaskHolder:selfFinish; results are%s null",
                       results ? " not" : "");
    auto& holders = Talvox::Talvox::getInstance().runningTaskHolders;
    holders.erase(std::remove(holders.begin(), holders.end(), self), holders.end());
}
