/**
 * @file
 * Many points, one after the other.
 */
#pragma once

#include <array>
#include <cstdint>
#include <map>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "Judge.h"
#include "Order.h"

namespace Torture {

/** What is to be run. */
struct Choice {
    std::string program;    /**< path of this program */
    std::string library;    /**< path of the preloaded library */
    int session = -1;       /**< -1: all */
    int kind = NO_KIND;     /**< `NO_KIND`: all */
    long call = 0;          /**< 0: all */
    int onward = -1;        /**< 0 or 1; -1: both */
    std::size_t sample = 0; /**< how many points of them; 0: all */
    std::uint32_t seed = 1;
    std::size_t workers = 2;
    bool isSettled = false; /**< leaves out what is known to have faults */
    bool isVerbose = false;
    std::string document; /**< whose tables are to be written; empty: none */
};

/** What came of the points of one kind and session. */
struct Cell {
    long calls = 0; /**< in a run without failures */
    std::array<long, ENDING_COUNT> endings{};
    long faults = 0;

    long getPoints() const;
};

/** Runs the points that were chosen, on as many processes at a time as there are workers. */
class Campaign {
  public:
    using Key = std::pair<int, int>; /**< kind and session */

    explicit Campaign(Choice wanted);

    /** Prints each fault with the command that repeats it. @return whether there was none */
    bool run();

    /** Of kinds and sessions that were run. */
    const std::map<Key, Cell>& getCells() const { return cells; }

  private:
    struct Point {
        int session = 0;
        int kind = 0;
        long call = 0;
        int onward = 0;
    };

    void calibrate(Worker& worker, Surroundings& surroundings);
    void makePoints();
    void addCell(int kind, int session, std::vector<std::vector<Point>>& groups);
    void work();
    bool takePoint(Point& point);
    void runPoint(Worker& worker, Surroundings& surroundings, const Point& point);
    void report(const Point& point, const Judgement& judgement, const Answer& answer);
    std::string makeCommand(const Point& point) const;

    const Choice choice;
    std::map<int, Reference> references;
    std::vector<Point> points;
    std::mutex mutex;  // guards what follows
    std::size_t nextPoint = 0;
    std::map<Key, Cell> cells;
    long faultyPoints = 0;
};

}  // namespace Torture
