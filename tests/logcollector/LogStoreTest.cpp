#include "logcollector/impl/LogStore.h"

#include <gmock/gmock.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <csignal>
#include <cstring>
#include <memory>
#include <thread>

#include "StoreFolder.h"
#include "logcollector/impl/Crc32.h"
#include "pal/kd_time.h"
#include "support/LogCapture.h"

using LogCollector::LogRecord;
using LogCollector::LogStore;
using LogCollector::LogStoreOptions;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;
namespace StoreFormat = LogCollector::StoreFormat;

namespace {

using Texts = std::vector<std::string>;

constexpr std::size_t FRONT = StoreFormat::FRONT_BYTES;
constexpr std::size_t HEAD = StoreFormat::HEAD_BYTES;
constexpr int64_t NS_PER_S = 1000000000;

class LogStoreTest : public ::testing::Test {
  protected:
    LogStoreTest() { kdUseManualClockKOR(1000 * NS_PER_S); }
    ~LogStoreTest() override { kdUseRealClockKOR(); }

    /** As a process does that starts: the store before is gone. @return whether it could be used */
    bool open(const LogStoreOptions& options) {
        store.reset();
        rest = LogStore::Rest();
        store = LogStore::open(options, rest);
        return store != nullptr;
    }
    bool open() { return open(folder.options()); }

    std::vector<uint64_t> add(const Texts& texts) {
        std::vector<uint64_t> tickets;
        for (const std::string& text : texts) {
            tickets.push_back(store->add(text));
        }
        return tickets;
    }

    Texts left() const {
        Texts texts;
        for (const LogRecord& record : rest.records) {
            texts.push_back(record.text);
        }
        return texts;
    }

    std::string refusal(const std::string& reason) const {
        return "LogStore: " + folder.path() + " is not used, records are in memory only: " + reason;
    }

    TestSupport::LogCapture log;
    StoreFolder folder;
    LogStore::Rest rest;
    std::unique_ptr<LogStore> store;
};

TEST_F(LogStoreTest, HasTheRecordsOfTheProcessBeforeInTheirOrder) {
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), IsEmpty());
    EXPECT_THAT(add({"a", "", std::string("c\0;", 3)}),
                ElementsAre(0x100000010, 0x10000002D, 0x100000049));
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("a", "", std::string("c\0;", 3)));
    EXPECT_EQ(0x100000010U, rest.records.front().ticket);
    add({"d"});
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("a", "", std::string("c\0;", 3), "d"));
    EXPECT_THAT(folder.segments(), ElementsAre("records-0000000001"));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST_F(LogStoreTest, IsReadableForItsUserOnly) {
    ASSERT_TRUE(open());
    add({"a"});
    struct stat status = {};
    ASSERT_EQ(0, stat(folder.path().c_str(), &status));
    EXPECT_EQ(0700U, status.st_mode & 0777U);
    ASSERT_EQ(0, stat(folder.pathOf(1).c_str(), &status));
    EXPECT_EQ(0600U, status.st_mode & 0777U);
}

TEST_F(LogStoreTest, ForgetsWhatIsDelivered) {
    ASSERT_TRUE(open());
    const std::vector<uint64_t> tickets = add({"a", "b", "c"});
    store->remove(tickets[1]);
    store->remove(0);
    store->remove(uint64_t{99} << 32U);
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("a", "c"));
    store->remove(tickets[0]);
    store->remove(tickets[2]);
    // Nothing of a delivered record's text stays behind.
    EXPECT_EQ(HEAD, folder.size());
    store->remove(tickets[2]);
    add({"d"});
    EXPECT_EQ(HEAD + FRONT + 1, folder.size());
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("d"));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST_F(LogStoreTest, RemovesEachSegmentWithItsLastRecord) {
    ASSERT_TRUE(open(folder.options(LogStoreOptions::MAX_BYTES_LEAST)));
    const std::string text(200, 'x');  // a segment is full with the second one
    const std::vector<uint64_t> tickets = add({text, text, text, text, "e"});
    EXPECT_THAT(folder.segments(),
                ElementsAre("records-0000000001", "records-0000000002", "records-0000000003"));
    store->remove(tickets[2]);
    store->remove(tickets[3]);
    EXPECT_THAT(folder.segments(), ElementsAre("records-0000000001", "records-0000000003"));
    store->remove(tickets[4]);
    EXPECT_EQ(HEAD, folder.read(3).size());
    store->remove(tickets[0]);
    ASSERT_TRUE(open(folder.options(LogStoreOptions::MAX_BYTES_LEAST)));
    EXPECT_THAT(left(), ElementsAre(text));
    EXPECT_THAT(folder.segments(), ElementsAre("records-0000000001"));
    // Numbers are not used twice in the life of a folder with records.
    add({"f"});
    EXPECT_THAT(folder.segments(), ElementsAre("records-0000000001", "records-0000000004"));
}

TEST_F(LogStoreTest, LeavesOutAtMostOneRecordForAChangedByte) {
    ASSERT_TRUE(open());
    const Texts texts = {"first", "second", "third"};
    const std::vector<uint64_t> tickets = add(texts);
    store->remove(tickets[0]);
    store.reset();
    const std::string sound = folder.read(1);
    for (std::size_t at = 0; at < sound.size(); ++at) {
        for (const unsigned change : {0x01U, 0x80U, 0xFFU}) {
            SCOPED_TRACE(at);
            std::string bytes = sound;
            bytes[at] = static_cast<char>(static_cast<unsigned char>(bytes[at]) ^ change);
            std::filesystem::remove(folder.pathOf(2));
            folder.write(1, bytes);
            log.clear();
            ASSERT_TRUE(open());
            EXPECT_THAT(log.messages(),
                        ElementsAre(StartsWith("LogStore: " + folder.pathOf(1) + " is damaged: ")));
            const std::size_t second = HEAD + FRONT + 5;
            const std::size_t third = second + FRONT + 6;
            if (at >= HEAD && at < HEAD + 4) {
                EXPECT_THAT(left(), ElementsAre("first", "second", "third"));
            } else if (at >= second + 4 && at < third) {
                EXPECT_THAT(left(), ElementsAre("third"));
            } else if (at >= third + 4) {
                EXPECT_THAT(left(), ElementsAre("second"));
            } else {
                EXPECT_THAT(left(), ElementsAre("second", "third"));
            }
            // What is damaged is left alone, and the store works on.
            EXPECT_NE(0U, store->add("new"));
            EXPECT_EQ(bytes, folder.read(1));
            ASSERT_TRUE(open());
            EXPECT_EQ("new", left().back());
        }
    }
}

TEST_F(LogStoreTest, GoesOnAfterAFileOfAnyLength) {
    ASSERT_TRUE(open());
    add({"first", "second", "third"});
    store.reset();
    const std::string whole = folder.read(1);
    const std::vector<std::size_t> ends = {0, HEAD, HEAD + FRONT + 5, HEAD + 2 * FRONT + 11};
    for (std::size_t size = 0; size < whole.size(); ++size) {
        SCOPED_TRACE(size);
        std::filesystem::remove_all(folder.path());
        std::filesystem::create_directory(folder.path());
        folder.write(1, whole.substr(0, size));
        log.clear();
        ASSERT_TRUE(open());
        EXPECT_EQ(size < ends[2] ? 0U : size < ends[3] ? 1U : 2U, left().size());
        if (std::find(ends.begin(), ends.end(), size) == ends.end()) {
            EXPECT_THAT(log.messages(), ElementsAre(HasSubstr(" is damaged: ")));
        } else {
            EXPECT_THAT(log.messages(), IsEmpty());
        }
        const std::size_t before = left().size();
        EXPECT_NE(0U, store->add("new"));
        ASSERT_TRUE(open());
        EXPECT_EQ(before + 1, left().size());
        EXPECT_EQ("new", left().back());
    }
}

TEST_F(LogStoreTest, SaysWhatIsDamagedInOneLine) {
    ASSERT_TRUE(open());
    add({"first", "second", "third"});
    store.reset();
    std::string bytes = folder.read(1);
    bytes[0] = 'X';
    bytes[HEAD] = 1;
    bytes[HEAD + FRONT + 5 + FRONT] = 'X';
    folder.write(1, bytes);
    ASSERT_TRUE(open());
    EXPECT_THAT(log.messages(),
                ElementsAre("LogStore: " + folder.pathOf(1) +
                            " is damaged: no head, 34 bytes are no record, 1 marks cannot be read, "
                            "2 records are whole"));
}

TEST_F(LogStoreTest, BelongsToOneAtATime) {
    ASSERT_TRUE(open());
    add({"a"});
    LogStore::Rest none;
    EXPECT_EQ(nullptr, LogStore::open(folder.options(), none));
    EXPECT_THAT(none.records, IsEmpty());
    EXPECT_THAT(log.messages(), ElementsAre(refusal("another process uses it")));
    store->add("b");
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("a", "b"));
}

TEST_F(LogStoreTest, RefusesAFolderThatCannotBeUsed) {
    LogStoreOptions options = folder.options();
    options.folder = folder.path() + "/missing/store";
    EXPECT_FALSE(open(options));
    options.folder = "/dev/null";
    EXPECT_FALSE(open(options));
    options.folder = "";
    EXPECT_FALSE(open(options));
    const std::string prefix = "LogStore: ";
    const std::string suffix = " is not used, records are in memory only: ";
    EXPECT_THAT(log.messages(), ElementsAre(prefix + folder.path() + "/missing/store" + suffix +
                                                "No such file or directory",
                                            prefix + "/dev/null" + suffix + "Not a directory",
                                            prefix + suffix + "No such file or directory"));
}

TEST_F(LogStoreTest, RefusesAFolderThatItMayOnlyRead) {
    if (getuid() != 0) {
        GTEST_SKIP() << "only root can take another user's part";
    }
    ASSERT_TRUE(open());
    add({"a"});
    store.reset();
    std::filesystem::permissions(std::filesystem::path(folder.path()).parent_path(),
                                 std::filesystem::perms(0755));
    std::filesystem::permissions(folder.path(), std::filesystem::perms(0555));
    std::filesystem::permissions(folder.path() + "/lock", std::filesystem::perms(0666));
    std::filesystem::permissions(folder.pathOf(1), std::filesystem::perms(0666));
    // The system call itself changes the calling thread only.
    std::thread([this] {
        ASSERT_EQ(0, syscall(SYS_setresuid, 65534, 65534, 65534));
        EXPECT_FALSE(open());
    }).join();
    EXPECT_THAT(log.messages(), ElementsAre(refusal("Permission denied")));
}

TEST_F(LogStoreTest, RefusesAFolderOfALaterVersion) {
    ASSERT_TRUE(open());
    add({"a"});
    store.reset();
    std::string bytes = folder.read(1);
    bytes[8] = 2;
    const std::string place("\1\0\0\0", 4);
    const uint32_t sum = LogCollector::crc32({std::string_view(bytes).substr(0, 12), place});
    std::memcpy(&bytes[12], &sum, sizeof(sum));
    folder.write(1, bytes);
    EXPECT_FALSE(open());
    EXPECT_THAT(log.messages(),
                ElementsAre(refusal(folder.pathOf(1) + " has the format of a later version")));
    EXPECT_EQ(bytes, folder.read(1));
}

TEST_F(LogStoreTest, LeavesAloneWhatItCannotRead) {
    ASSERT_TRUE(open());
    add({"a"});
    std::filesystem::create_directory(folder.pathOf(2));
    std::ofstream(folder.path() + "/records-1") << "not ours";
    std::ofstream(folder.path() + "/records-0000000003.bak") << "not ours";
    std::ofstream(folder.path() + "/records-4294967295") << "not ours";
    std::filesystem::create_symlink("/etc/passwd", folder.pathOf(4));
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("a"));
    EXPECT_THAT(log.messages(),
                ElementsAre("LogStore: " + folder.pathOf(2) +
                                " cannot be read, it is left alone: Invalid argument",
                            "LogStore: " + folder.pathOf(4) +
                                " cannot be read, it is left alone: Too many levels of symbolic "
                                "links"));
    EXPECT_EQ(0x500000010U, store->add("b"));
    EXPECT_EQ(7U, folder.segments().size());
}

TEST_F(LogStoreTest, RepairsItsBounds) {
    LogStoreOptions options = folder.options(0);
    options.maxAgeS = int64_t{1} << 60U;
    ASSERT_TRUE(open(options));
    EXPECT_THAT(log.messages(),
                ElementsAre("LogStore: maxBytes 0 is out of range, 4096 is used",
                            "LogStore: maxAgeS 1152921504606846976 is out of range, 3153600000 is "
                            "used"));
    EXPECT_FALSE(store->isTooLarge(3000));
    EXPECT_TRUE(store->isTooLarge(4000));
}

/** Limits what a file may hold, for a while; the system then behaves as on a full disk. */
class FileSizeLimit {
  public:
    explicit FileSizeLimit(rlim_t bytes) : handler(std::signal(SIGXFSZ, SIG_IGN)) {
        getrlimit(RLIMIT_FSIZE, &before);
        const rlimit limit = {bytes, before.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FileSizeLimit() {
        setrlimit(RLIMIT_FSIZE, &before);
        std::signal(SIGXFSZ, handler);
    }
    FileSizeLimit(const FileSizeLimit&) = delete;
    FileSizeLimit& operator=(const FileSizeLimit&) = delete;

  private:
    rlimit before = {};
    void (*const handler)(int);
};

TEST_F(LogStoreTest, SaysOnceThatTheDiskRefusesAndOnceThatItTakesRecordsAgain) {
    ASSERT_TRUE(open());
    add({"a"});
    const std::size_t size = folder.size();
    {
        // Some of the frame fits: it is cut off again.
        const FileSizeLimit limit(size + 10);
        EXPECT_THAT(add({"b", "c"}), ElementsAre(0U, 0U));
    }
    EXPECT_EQ(size, folder.size());
    EXPECT_THAT(log.messages(),
                ElementsAre("LogStore: " + folder.path() +
                            ": a record cannot be written: File too large; records are in memory "
                            "only until it can"));
    EXPECT_THAT(add({"d", "e"}), Each(testing::Ne(0U)));
    EXPECT_THAT(log.messages(),
                ElementsAre(testing::_, "LogStore: " + folder.path() + " takes records again"));
    ASSERT_TRUE(open());
    EXPECT_THAT(left(), ElementsAre("a", "d", "e"));
}

TEST_F(LogStoreTest, LeavesNoFileWithoutAHead) {
    ASSERT_TRUE(open());
    {
        const FileSizeLimit limit(HEAD - 1);
        EXPECT_THAT(add({"a"}), ElementsAre(0U));
    }
    EXPECT_THAT(folder.segments(), IsEmpty());
    EXPECT_THAT(log.messages(), ElementsAre(HasSubstr(": no file can be written: File too large")));
}

TEST_F(LogStoreTest, GoesOnAfterAFullDisk) {
    std::filesystem::create_directory(folder.path());
    if (mount("none", folder.path().c_str(), "tmpfs", 0, "size=16k,mode=700") != 0) {
        GTEST_SKIP() << "no file system of a test's own: " << std::strerror(errno);
    }
    const auto unmount = [this](int*) { umount2(folder.path().c_str(), MNT_DETACH); };
    int mounted = 0;
    const std::unique_ptr<int, decltype(unmount)> guard(&mounted, unmount);
    ASSERT_TRUE(open());
    const std::string text(500, 'x');
    Texts stored;
    std::vector<uint64_t> tickets;
    while (stored.size() < 100) {
        tickets.push_back(store->add(text + std::to_string(stored.size())));
        if (tickets.back() == 0) {
            break;
        }
        stored.push_back(text + std::to_string(stored.size()));
    }
    ASSERT_EQ(0U, tickets.back());
    EXPECT_THAT(log.messages(),
                ElementsAre("LogStore: " + folder.path() +
                            ": a record cannot be written: No space left on device; records are "
                            "in memory only until it can"));
    ASSERT_TRUE(open());
    EXPECT_EQ(stored, left());
    for (const uint64_t ticket : tickets) {
        store->remove(ticket);
    }
    EXPECT_NE(0U, store->add(text));
    store.reset();
}

TEST_F(LogStoreTest, FinishesWhatAProcessBeganThatHasEnded) {
    LogStoreOptions options = folder.options(LogStoreOptions::MAX_BYTES_LEAST);
    ASSERT_TRUE(open(options));
    const std::string text(200, 'x');
    const std::vector<uint64_t> tickets = add({text + "1", text + "2", text + "3"});
    const uint64_t first = store->addNotice("one lost", {1, 0, 0});
    // Each notice is there, what has to follow it is not.
    store->addNotice("three lost", {3, 1, first});
    store->addNotice(text + "3, moved", {0, 0, tickets[2]});
    ASSERT_TRUE(open(options));
    EXPECT_THAT(left(), ElementsAre("three lost", text + "3, moved"));
    EXPECT_EQ(3U, rest.noticeLost);
    EXPECT_EQ(rest.records.front().ticket, rest.noticeTicket);
    EXPECT_THAT(folder.segments(), ElementsAre("records-0000000003"));
    ASSERT_TRUE(open(options));
    EXPECT_THAT(left(), ElementsAre("three lost", text + "3, moved"));
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST_F(LogStoreTest, SaysThatADeliveredRecordMayComeBack) {
    LogStoreOptions options = folder.options(LogStoreOptions::MAX_BYTES_LEAST);
    ASSERT_TRUE(open(options));
    const std::vector<uint64_t> tickets =
        add({std::string(200, 'x'), std::string(200, 'x'), "c", "d"});
    std::filesystem::remove(folder.pathOf(1));
    store->remove(tickets[0]);
    store->remove(tickets[1]);
    EXPECT_THAT(log.messages(),
                ElementsAre("LogStore: " + folder.pathOf(1) +
                                ": a delivered record cannot be marked and may be sent again: No "
                                "such file or directory",
                            "LogStore: " + folder.pathOf(1) +
                                " cannot be removed, its records may be sent again: No such file "
                                "or directory"));
    EXPECT_THAT(folder.segments(), ElementsAre("records-0000000002"));
}

}  // namespace
