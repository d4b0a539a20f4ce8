#include "talvox/SpeechError.h"

#include <gmock/gmock.h>

#include "support/AssertCapture.h"

using Talvox::SpeechError;
using TestSupport::AssertCapture;

TEST(SpeechError, CodesAndTextsAreFixed) {
    const struct {
        int code;
        int number;
        const char* text;
    } rows[] = {{SpeechError::ErrorUnknown, 0, "ErrorUnknown"},
                {SpeechError::ErrorAudio, 1, "ErrorAudio"},
                {SpeechError::ErrorEncoding, 2, "ErrorEncoding"},
                {SpeechError::ErrorNetwork, 3, "ErrorNetwork"},
                {SpeechError::ErrorServer, 4, "ErrorServer"},
                {SpeechError::ErrorCanceled, 5, "ErrorCanceled"},
                {SpeechError::ErrorNoVoice, 6, "ErrorNoVoice"},
                {SpeechError::ErrorNotAvailable, 7, "ErrorNotAvailable"},
                {SpeechError::ErrorBusy, 8, "ErrorBusy"}};
    for (const auto& row : rows) {
        EXPECT_EQ(row.number, row.code);
        EXPECT_EQ(row.text, SpeechError(row.code).getErrorString());
        EXPECT_EQ(row.text, SpeechError::errorStrings[row.number]);
        EXPECT_EQ(row.number, SpeechError(row.code).getCode());
    }
    EXPECT_EQ(9, SpeechError::ErrorMax);
}

TEST(SpeechError, ACodeOutsideTheRangeIsABrokenInvariant) {
    for (const int code : {9, -1, 1000}) {
        const AssertCapture asserts;
        EXPECT_EQ("ErrorUnknown", SpeechError(code).getErrorString());
        ASSERT_EQ(1U, asserts.count());
        EXPECT_EQ("code >= 0 && code < ErrorMax", asserts.reports()[0].condition);
        EXPECT_EQ("talvox/SpeechError", asserts.reports()[0].path);
    }
}
