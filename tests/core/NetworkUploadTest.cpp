#include <random>
#include <thread>

#include "NetworkFixture.h"

using Network::HttpRequest;
using Network::NetworkTaskWriter;
using ::testing::ElementsAre;
using TestSupport::Answer;

namespace {

using WriterPtr = boost::shared_ptr<NetworkTaskWriter>;

class NetworkUploadTest : public NetworkFixture {
  protected:
    std::string hostLine() const { return "Host: 127.0.0.1:" + std::to_string(server.getPort()); }

    const WriterPtr writer = boost::make_shared<NetworkTaskWriter>();
};

TEST_F(NetworkUploadTest, SendsAWholeBodyByteForByte) {
    std::string body = "line\r\n";
    body += '\0';
    body += "\xFF end";
    const auto task = makeUpload(server.getUrl() + "/asrgw?uuid=1", body);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    const auto request = server.getRequest(0);
    EXPECT_EQ("POST /asrgw?uuid=1 HTTP/1.1\r\n" + hostLine() +
                  "\r\nAccept: */*\r\nContent-Type: multipart/form-data; boundary=BOUNDARY\r\n"
                  "Content-Length: " +
                  std::to_string(body.size()) + "\r\n\r\n",
              request.head);
    EXPECT_EQ(body, request.body);
    EXPECT_TRUE(request.chunkSizes.empty());
}

TEST_F(NetworkUploadTest, SendsAnEmptyBodyWithItsLength) {
    const auto task = makeTask(server.getUrl(), "POST");
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("POST / HTTP/1.1\r\n" + hostLine() + "\r\nAccept: */*\r\nContent-Length: 0\r\n\r\n",
              server.getRequest(0).head);
}

TEST_F(NetworkUploadTest, SendsALargeBody) {
    std::string body(3000000, '\0');
    std::mt19937 random(1);
    std::generate(body.begin(), body.end(), [&random] { return static_cast<char>(random()); });
    const auto task = makeUpload(server.getUrl(), body);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_TRUE(body == server.getRequest(0).body);
}

TEST_F(NetworkUploadTest, StreamsEachWriteAsItComes) {
    const std::string url = server.getUrl();
    const WriterPtr source = writer;
    const auto task = boost::make_shared<RecordingTask>([url, source] {
        auto request =
            HttpRequest::create(url + "/asrgw_chunked?uuid=1", "POST", REQUEST_TIMEOUT_MS, false);
        request->setChunked(true);
        request->setBoundary("BOUNDARY");
        request->addBoundaryHeader();
        request->setWriter(source);
        return request;
    });
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForHead(1));
    write(*writer, "one");
    ASSERT_TRUE(server.waitForBody(0, 3));
    write(*writer, "twenty");
    ASSERT_TRUE(server.waitForBody(0, 9));
    EXPECT_FALSE(server.getRequest(0).complete);
    writer->close();
    EXPECT_EQ("finished 200", task->waitForEnd());
    const auto request = server.getRequest(0);
    EXPECT_EQ("POST /asrgw_chunked?uuid=1 HTTP/1.1\r\n" + hostLine() +
                  "\r\nAccept: */*\r\n"
                  "Content-Type: multipart/form-data; boundary=BOUNDARY\r\n"
                  "Transfer-Encoding: chunked\r\n\r\n",
              request.head);
    EXPECT_EQ("onetwenty", request.body);
    EXPECT_THAT(request.chunkSizes, ElementsAre(3, 6));
}

TEST_F(NetworkUploadTest, StreamsWhatWasWrittenBeforeItBegan) {
    write(*writer, "all of it");
    writer->close();
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("all of it", server.getRequest(0).body);
}

TEST_F(NetworkUploadTest, StreamsAnEmptyBody) {
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForHead(1));
    writer->close();
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_TRUE(server.getRequest(0).complete);
    EXPECT_EQ("", server.getRequest(0).body);
}

TEST_F(NetworkUploadTest, StreamsWhatSeveralThreadsWriteWithoutLosingAByte) {
    constexpr int WRITES = 2000;
    constexpr int THREADS = 3;
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    std::vector<std::thread> threads;
    threads.reserve(THREADS);
    for (int i = 0; i < THREADS; ++i) {
        threads.emplace_back([this, i] {
            const std::string piece(7, static_cast<char>('a' + i));
            for (int n = 0; n < WRITES; ++n) {
                write(*writer, piece);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    writer->close();
    EXPECT_EQ("finished 200", task->waitForEnd());
    const std::string body = server.getRequest(0).body;
    ASSERT_EQ(static_cast<std::size_t>(THREADS * WRITES * 7), body.size());
    for (std::size_t i = 0; i < body.size(); i += 7) {
        ASSERT_EQ(std::string(7, body[i]), body.substr(i, 7));
    }
}

TEST_F(NetworkUploadTest, NeverBlocksTheWriterWhenThePeerDoesNotRead) {
    server.script({Answer::status(200).notReading()});
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForHead(1));
    const std::string piece(1000000, 'x');
    for (int i = 0; i < 20; ++i) {
        write(*writer, piece);
    }
    writer->close();
    EXPECT_EQ(0U, server.getRequest(0).body.size());
    server.release();
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ(20 * piece.size(), server.getRequest(0).body.size());
}

TEST_F(NetworkUploadTest, DoesNotFollowARedirect) {
    server.script({Answer::status(307, {{"Location", server.getUrl() + "/other"}}),
                   Answer::status(301, {{"Location", server.getUrl() + "/other"}})});
    const std::string url = server.getUrl();
    for (const int code : {307, 301}) {
        const auto task = boost::make_shared<RecordingTask>([url] {
            auto request = HttpRequest::create(url, "POST", REQUEST_TIMEOUT_MS, true);
            request->setBody("B", "body");
            return request;
        });
        holder.submitNoRetries(task);
        EXPECT_EQ("finished " + std::to_string(code), task->waitForEnd());
    }
    EXPECT_EQ(2U, server.getRequestCount());
}

TEST_F(NetworkUploadTest, EndsAtOnceWhenThePeerRefusesEarly) {
    server.script({Answer::status(503, {{"X-Answer", "busy"}}).onHead().thenClose()});
    write(*writer, "beginning");
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 503", task->waitForEnd());
    EXPECT_EQ("busy", task->getResponse()->getHeader("X-Answer"));
    EXPECT_FALSE(writer->isClosed());
}

TEST_F(NetworkUploadTest, EndsWhenThePeerAnswersBeforeTheBodyEnds) {
    server.script({Answer::status(200, {{"X-Answer", "early"}}, "known").afterBodyBytes(4)});
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    write(*writer, "word");
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("early", task->getResponse()->getHeader("X-Answer"));
    EXPECT_EQ("known", task->getBody());
    write(*writer, "nobody waits for this");
    // The peer was told that nothing follows, so the connection can serve the next request.
    const auto next = makeTask(server.getUrl());
    holder.submitNoRetries(next);
    EXPECT_EQ("finished 200", next->waitForEnd());
    EXPECT_EQ("word", server.getRequest(0).body);
    EXPECT_EQ(1U, server.getConnectionCount());
}

TEST_F(NetworkUploadTest, AnEarlyAnswerEndsABodyThatPauses) {
    server.script({Answer::status(200), Answer::status(204).afterBodyBytes(4).held()});
    // On a kept connection libcurl has no timer of its own that would end the wait, too.
    const auto first = makeTask(server.getUrl());
    holder.submitNoRetries(first);
    EXPECT_EQ("finished 200", first->waitForEnd());
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    write(*writer, "word");
    ASSERT_TRUE(server.waitForBody(1, 4));
    settle();
    settle();
    server.release();
    EXPECT_EQ("finished 204", task->waitForEnd());
    ASSERT_TRUE(server.waitForRequest(2));
    EXPECT_EQ("word", server.getRequest(1).body);
    EXPECT_EQ(1U, server.getConnectionCount());
}

TEST_F(NetworkUploadTest, KeepsAnEarlyAnswerOfAPeerThatClosesAtOnce) {
    server.script({Answer::status(200, {{"Connection", "close"}}, "known").onHead().thenClose()});
    const auto task = makeUpload(server.getUrl(), std::string(5000000, 'x'));
    holder.submitNoRetries(task);
    EXPECT_EQ("finished 200", task->waitForEnd());
    EXPECT_EQ("known", task->getBody());
}

TEST_F(NetworkUploadTest, FailsWhenThePeerResetsInTheMiddle) {
    server.script({Answer::resetAfter(4)});
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    write(*writer, "word");
    EXPECT_EQ("finished -1", task->waitForEnd());
}

TEST_F(NetworkUploadTest, FailsWithOneOfTheNextWritesWhenThePeerHasClosed) {
    server.script({Answer::closing().onHead()});
    const auto task = makeStream(server.getUrl(), writer);
    holder.submitNoRetries(task);
    ASSERT_TRUE(server.waitForClosed(1));
    int writes = 0;
    for (; writes < 100 && holder.isWorking(); ++writes) {
        write(*writer, "x");
        settle();
    }
    EXPECT_EQ("finished -1", task->waitForEnd());
    EXPECT_LE(writes, 10);
}

TEST_F(NetworkUploadTest, SurvivesAWriterThatGoesOnAfterTheEnd) {
    server.setDefaultAnswer(Answer::resetAfter(1));
    for (int i = 0; i < 50; ++i) {
        const WriterPtr source = boost::make_shared<NetworkTaskWriter>();
        const auto task = makeStream(server.getUrl(), source);
        holder.submitNoRetries(task);
        while (task->getEvents().empty() || task->getEvents().back() != "finished -1") {
            write(*source, "x");
        }
        write(*source, "after the end");
        source->close();
    }
    EXPECT_EQ(50U, server.getRequestCount());
}

TEST(NetworkTaskWriterTest, KeepsWhatIsWritten) {
    NetworkTaskWriter writer;
    EXPECT_EQ(5, writer.write("hello", 5));
    EXPECT_EQ(0, writer.write("", 0));
    EXPECT_EQ(0, writer.write(nullptr, 0));
    EXPECT_EQ(2, writer.write(" w", 2));
    EXPECT_EQ(7U, writer.getSize());
    char bytes[4] = {};
    EXPECT_EQ(4U, writer.read(3, bytes, sizeof(bytes)));
    EXPECT_EQ("lo w", std::string(bytes, 4));
    EXPECT_EQ(0U, writer.read(7, bytes, sizeof(bytes)));
    EXPECT_EQ(0U, writer.read(100, bytes, sizeof(bytes)));
}

TEST(NetworkTaskWriterTest, RefusesWritesOnceClosed) {
    NetworkTaskWriter writer;
    EXPECT_FALSE(writer.isClosed());
    writer.close();
    writer.close();
    EXPECT_TRUE(writer.isClosed());
    EXPECT_EQ(-1, writer.write("x", 1));
    EXPECT_EQ(0U, writer.getSize());
}

TEST(NetworkTaskWriterTest, WakesItsReaderAfterEachChange) {
    NetworkTaskWriter writer;
    int calls = 0;
    writer.setWakeUp([&] {
        ++calls;
        writer.getSize();  // no lock of the writer is held here
    });
    writer.write("x", 1);
    EXPECT_EQ(1, calls);
    writer.close();
    writer.close();
    EXPECT_EQ(2, calls);
    writer.setWakeUp({});
    writer.write("x", 1);
    EXPECT_EQ(2, calls);
}

}  // namespace
