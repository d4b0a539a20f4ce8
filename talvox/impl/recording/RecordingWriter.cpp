// Sessions put jobs into `jobs` under the mutex, which is held for no more than that; the thread
// takes all of them at once and writes without it. Lines that may wait are written with the next
// one that may not, so that the thread wakes up about as often as buffers arrive.
#include "talvox/impl/recording/RecordingWriter.h"

#include <algorithm>
#include <exception>
#include <utility>

#include "pal/SignalsBlocked.h"
#include "pal/kd_log.h"

namespace Talvox {

RecordingWriter::RecordingWriter(const std::string& folder, int64_t maxBytes)
    : folders(folder, maxBytes) {}

RecordingWriter::~RecordingWriter() {
    stop();
}

bool RecordingWriter::start() {
    if (!folders.prepare()) {
        return false;
    }
    const korvel_pal::SignalsBlocked signalsBlocked;
    try {
        thread = std::thread([this] { run(); });
    } catch (const std::exception& exception) {
        kdLogFormatMessage("SessionRecording: there is no thread for it: %s", exception.what());
        return false;
    }
    return true;
}

void RecordingWriter::stop() {
    {
        const std::lock_guard<std::mutex> lock(mutex);
        stopping = true;
        changed.notify_one();
    }
    if (thread.joinable()) {
        thread.join();
    }
}

void RecordingWriter::open(const Files& files, int64_t calendarTime, std::string description) {
    put({files, Kind::OPEN, calendarTime, std::move(description)}, true);
}

void RecordingWriter::writeLine(const Files& files, std::string line, bool isUrgent) {
    line += '\n';
    put({files, Kind::LINE, 0, std::move(line)}, isUrgent);
}

void RecordingWriter::writeSound(const Files& files, const unsigned char* bytes, std::size_t size) {
    put({files, Kind::SOUND, 0, std::string(reinterpret_cast<const char*>(bytes), size)}, true);
}

void RecordingWriter::close(const Files& files, std::string reason, int64_t time) {
    put({files, Kind::CLOSE, time, std::move(reason)}, true);
}

void RecordingWriter::put(Job job, bool isUrgent) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (stopping) {
        job.files->breakOff();
        return;
    }
    const std::size_t size = job.bytes.size();
    const bool hasRoom = size <= MOST_QUEUED_BYTES - std::min(queuedBytes, MOST_QUEUED_BYTES);
    if (job.kind != Kind::CLOSE && !hasRoom) {
        if (job.files->breakOff()) {
            kdLogMessage("SessionRecording: the disk is too slow, the recording ends");
            jobs.push_back({job.files, Kind::CLOSE, -1, "the disk is too slow"});
        }
        return;
    }
    queuedBytes += size;
    jobs.push_back(std::move(job));
    isWanted = isWanted || isUrgent;
    if (isUrgent) {
        changed.notify_one();
    }
}

void RecordingWriter::run() {
    std::vector<Job> taken;
    while (takeJobs(taken)) {
        perform(taken);
        taken.clear();
    }
    closeCurrent("the recording was switched off");
}

bool RecordingWriter::takeJobs(std::vector<Job>& taken) {
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [this] { return isWanted || stopping; });
    isWanted = false;
    queuedBytes = 0;
    taken.swap(jobs);
    return !stopping || !taken.empty();
}

void RecordingWriter::perform(const std::vector<Job>& batch) {
    for (const Job& job : batch) {
        try {
            perform(job);
        } catch (const std::exception& exception) {
            kdLogFormatMessage("SessionRecording: the recording ends: %s", exception.what());
            job.files->breakOff();
        }
    }
}

void RecordingWriter::perform(const Job& job) {
    RecordingFiles& files = *job.files;
    switch (job.kind) {
        case Kind::OPEN:
            openFiles(job);
            return;
        case Kind::LINE:
            files.writeLines(job.bytes);
            break;
        case Kind::SOUND:
            files.writeSound(job.bytes);
            break;
        case Kind::CLOSE:
            files.close(job.bytes, job.time);
            break;
    }
    if (files.isOpen() && !folders.makeRoom(files.getSize())) {
        kdLogMessage("SessionRecording: a recording has reached the bound and ends");
        files.breakOff();
        files.close("the bound on the folder is reached", -1);
    }
    if (!files.isOpen()) {
        current.erase(std::remove(current.begin(), current.end(), job.files), current.end());
    }
}

void RecordingWriter::openFiles(const Job& job) {
    const std::string folder = folders.makeFolder(job.time);
    if (folder.empty() || !job.files->open(folder, job.bytes)) {
        job.files->breakOff();
        return;
    }
    current.push_back(job.files);
}

void RecordingWriter::closeCurrent(const char* reason) {
    for (const Files& files : current) {
        files->breakOff();
        files->close(reason, -1);
    }
    current.clear();
}

}  // namespace Talvox
