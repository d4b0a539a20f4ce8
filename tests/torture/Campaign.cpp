#include "Campaign.h"

#include <algorithm>
#include <cstdio>
#include <random>
#include <thread>

#include "Open.h"
#include "Worker.h"

namespace Torture {

namespace {

/** Enough to look at; more of them are only counted. */
constexpr long FAULTS_PRINTED_MAX = 200;

}  // namespace

long Cell::getPoints() const {
    long points = 0;
    for (const long count : endings) {
        points += count;
    }
    return points;
}

Campaign::Campaign(Choice wanted) : choice(std::move(wanted)) {}

bool Campaign::run() {
    {
        Worker worker(choice.program, choice.library);
        Surroundings surroundings;
        calibrate(worker, surroundings);
    }
    if (faultyPoints > 0) {
        return false;
    }
    makePoints();
    std::printf("%zu points, seed %u\n", points.size(), choice.seed);
    std::fflush(stdout);
    std::vector<std::thread> threads;
    for (std::size_t i = 0; i < choice.workers; ++i) {
        threads.emplace_back([this] { work(); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    if (faultyPoints > 0) {
        std::printf("%ld of %zu points have faults\n", faultyPoints, points.size());
    }
    return faultyPoints == 0;
}

void Campaign::calibrate(Worker& worker, Surroundings& surroundings) {
    for (int session = 0; session < static_cast<int>(getPlans().size()); ++session) {
        if (choice.session >= 0 && session != choice.session) {
            continue;
        }
        const Plan& plan = getPlans()[static_cast<std::size_t>(session)];
        Order order;
        order.session = session;
        surroundings.prepare(plan, order);
        const std::string obstacle = surroundings.findObstacle(plan);
        if (!obstacle.empty()) {
            std::printf("%s is left out: %s\n", plan.name, obstacle.c_str());
            continue;
        }
        const Answer answer = worker.serve(order);
        const Traffic traffic = surroundings.getTraffic();
        const std::vector<std::string> faults = judgeReference(plan, answer, traffic);
        if (!faults.empty()) {
            Judgement judgement;
            judgement.faults = faults;
            report({session, NO_KIND, 0, 0}, judgement, answer);
            continue;
        }
        references[session] = {answer.verdict.report, traffic};
    }
}

void Campaign::makePoints() {
    std::vector<std::vector<Point>> groups;
    for (int kind = 0; kind < KIND_COUNT; ++kind) {
        for (const auto& entry : references) {
            const Plan& plan = getPlans()[static_cast<std::size_t>(entry.first)];
            const bool isLeftOut = choice.isSettled && isOpen(static_cast<Kind>(kind), plan);
            if ((choice.kind == NO_KIND || choice.kind == kind) && !isLeftOut) {
                addCell(kind, entry.first, groups);
            }
        }
    }
    std::mt19937 random(choice.seed);
    if (choice.sample == 0) {
        for (const std::vector<Point>& group : groups) {
            points.insert(points.end(), group.begin(), group.end());
        }
        return;
    }
    // By turns, so that a kind with few calls has its part.
    for (std::vector<Point>& group : groups) {
        std::shuffle(group.begin(), group.end(), random);
    }
    for (std::size_t turn = 0; points.size() < choice.sample && !groups.empty(); ++turn) {
        const std::size_t before = points.size();
        for (const std::vector<Point>& group : groups) {
            if (turn < group.size() && points.size() < choice.sample) {
                points.push_back(group[turn]);
            }
        }
        if (points.size() == before) {
            return;
        }
    }
}

void Campaign::addCell(int kind, int session, std::vector<std::vector<Point>>& groups) {
    const long calls = references[session].report.calls[kind];
    cells[{kind, session}].calls = calls;
    std::vector<Point> group;
    for (long call = 1; call <= std::max(calls, choice.call); ++call) {
        for (int onward = 0; onward < 2; ++onward) {
            if ((choice.call == 0 || choice.call == call) &&
                (choice.onward < 0 || choice.onward == onward)) {
                group.push_back({session, kind, call, onward});
            }
        }
    }
    groups.push_back(group);
}

void Campaign::work() {
    Worker worker(choice.program, choice.library);
    Surroundings surroundings;
    for (Point point; takePoint(point);) {
        runPoint(worker, surroundings, point);
    }
}

bool Campaign::takePoint(Point& point) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (nextPoint >= points.size()) {
        return false;
    }
    point = points[nextPoint++];
    return true;
}

void Campaign::runPoint(Worker& worker, Surroundings& surroundings, const Point& point) {
    const Plan& plan = getPlans()[static_cast<std::size_t>(point.session)];
    const Reference& reference = references.at(point.session);
    Order order;
    order.session = point.session;
    order.kind = point.kind;
    order.call = point.call;
    order.onward = point.onward;
    order.withStack = choice.isVerbose ? 1 : 0;
    order.holdings = reference.report.holdings;
    surroundings.prepare(plan, order);
    const Answer answer = worker.serve(order);
    const Judgement judgement = judge(plan, reference, order, answer, surroundings.getTraffic());
    const std::lock_guard<std::mutex> lock(mutex);
    Cell& cell = cells[{point.kind, point.session}];
    ++cell.endings[static_cast<std::size_t>(judgement.ending)];
    if (!judgement.faults.empty()) {
        ++cell.faults;
    }
    if (!judgement.faults.empty() || choice.isVerbose) {
        report(point, judgement, answer);
    }
}

std::string Campaign::makeCommand(const Point& point) const {
    std::string command =
        choice.program + " --session " + getPlans()[static_cast<std::size_t>(point.session)].name;
    if (point.kind != NO_KIND) {
        command += std::string(" ") + getName(static_cast<Kind>(point.kind)) + " --call " +
                   std::to_string(point.call) + (point.onward != 0 ? " --onward" : " --once");
    }
    return command;
}

void Campaign::report(const Point& point, const Judgement& judgement, const Answer& answer) {
    const bool isFaulty = !judgement.faults.empty();
    faultyPoints += isFaulty ? 1 : 0;
    if (faultyPoints > FAULTS_PRINTED_MAX) {
        return;
    }
    const Report& found = answer.verdict.report;
    std::printf("%s: %s\n", isFaulty ? "FAULT" : "point", makeCommand(point).c_str());
    std::printf("  failed: %s\n", found.failed[0] != '\0' ? found.failed : "nothing");
    for (const std::string& fault : judgement.faults) {
        std::printf("  %s\n", fault.c_str());
    }
    if (choice.isVerbose) {
        std::printf("  first: created %d, ends %d, error %d, results %d, after %lld ms\n",
                    found.first.created, found.first.ends, found.first.error, found.first.results,
                    static_cast<long long>(found.first.endMs));
        std::printf("  next: created %d, ends %d, error %d, results %d\n", found.next.created,
                    found.next.ends, found.next.error, found.next.results);
        std::printf("  threads %zu, connections %zu, other descriptors %zu, exit %lld ms\n",
                    found.holdings.threads, found.holdings.connections, found.holdings.descriptors,
                    static_cast<long long>(answer.verdict.exitMs));
        std::printf("--- log\n%s--- output\n%s---\n", found.log, answer.output.c_str());
    }
    std::fflush(stdout);
}

}  // namespace Torture
