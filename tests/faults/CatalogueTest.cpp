#include <gtest/gtest.h>

#include "Catalogue.h"
#include "FaultTable.h"
#include "talvox/Settings.h"
#include "teardown/app/SilentNameServer.h"

namespace FaultTest {

namespace {

std::vector<Fault> getFaults() {
    std::vector<Fault> all;
    for (const Chapter& chapter : getCatalogue()) {
        all.insert(all.end(), chapter.faults.begin(), chapter.faults.end());
    }
    return all;
}

/** Each fault in both modes, against what is expected of it and what the table says. */
class CatalogueTest : public FaultSession,
                      public Surroundings,
                      public ::testing::WithParamInterface<Fault> {
  protected:
    void TearDown() override {
        if (asksNameServer) {
            EXPECT_TRUE(::TearDown::waitForQuestions(static_cast<int>(questions)));
            ::TearDown::answerQuestions();
        }
        FaultSession::TearDown();
    }

    TestSupport::ScriptedHttpServer& gateway() override { return *server; }

    void say(TestSupport::Samples utterance) override { sound = std::move(utterance); }

    void atEachStep(std::function<void(int64_t elapsedMs)> action) override {
        onStep = [this, action] { action(elapsedMs()); };
    }

    void putUrl(const std::string& url) override {
        asksNameServer = true;
        configureText(Talvox::Settings::SKS_URL, url);
    }

    void check(bool chunked, const Expected& expected) {
        SCOPED_TRACE(chunked ? "chunked" : "simple");
        setChunked(chunked);
        GetParam().arrange(*this);
        const SessionOutcome outcome = run();
        EXPECT_EQ(expected.end, outcome.end) << outcome.events;
        EXPECT_EQ(expected.requests, outcome.requests);
        checkTable(GetParam(), chunked, outcome);
        questions += asksNameServer ? outcome.attempts : 0;
    }

    bool asksNameServer = false;
    /** Of all tests so far. */
    static inline std::size_t questions = 0;
};

TEST_P(CatalogueTest, SimpleMode) {
    check(false, GetParam().simple);
}

TEST_P(CatalogueTest, ChunkedMode) {
    check(true, GetParam().chunked);
}

INSTANTIATE_TEST_SUITE_P(Faults, CatalogueTest, ::testing::ValuesIn(getFaults()),
                         [](const ::testing::TestParamInfo<Fault>& fault) {
                             return fault.param.name;
                         });

TEST(FaultTable, HasTheRowsOfTheCatalogueAndNoOthers) {
    checkRows();
}

}  // namespace

}  // namespace FaultTest
