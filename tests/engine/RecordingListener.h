#pragma once

#include <boost/shared_ptr.hpp>
#include <functional>
#include <vector>

#include "talvox/Recognizer.h"
#include "talvox/RecognizerListenerAdapter.h"

namespace TestSupport {

/** Keeps the terminal events of a recognition. */
class RecordingListener : public Talvox::RecognizerListenerAdapter {
  public:
    void onResults(Talvox::Recognizer* recognizer,
                   boost::shared_ptr<Talvox::Recognition> recognition) override {
        callers.push_back(recognizer);
        recognitions.push_back(recognition);
        if (whenResults) {
            whenResults();
        }
    }

    void onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) override {
        callers.push_back(recognizer);
        errors.push_back(error.getCode());
        if (whenError) {
            whenError();
        }
    }

    std::vector<Talvox::Recognizer*> callers;
    std::vector<boost::shared_ptr<Talvox::Recognition>> recognitions;
    std::vector<int> errors;
    std::function<void()> whenError;
    std::function<void()> whenResults;
};

}  // namespace TestSupport
