// Cost against size: each series on one chart (SVG) and in one table (markdown, standard output).
//
//   qlx_growth FOLDER CHART.svg [SECONDS]
//
// Each point is measured in a process of its own, which is ended after SECONDS (20 when not given):
// the table then says so, and the chart ends there.
#include <qlx/qlx.h>
#include <qlx/class.h>

#include <signal.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <vector>

namespace {

using Clock = std::chrono::steady_clock;

std::string gFolder;

[[noreturn]] void fail(const std::string &what) {
  fprintf(stderr, "qlx_growth: %s\n", what.c_str());
  _exit(1);
}

// ---- What is measured: seconds of each step ----

constexpr size_t kMaxSteps = 3;
using Steps = std::array<double, kMaxSteps>;

double secondsOf(const std::function<void()> &work) {
  const Clock::time_point begin = Clock::now();
  work();
  return std::chrono::duration<double>(Clock::now() - begin).count();
}

void set(const char *name, const char *key, const std::string &value) {
  ObjCfg *cfg = QlxLogMgrGetCfg(name);
  if (!QlxSetObjCfgProp(cfg, key, value.c_str())) fail("a property was not set");
  QlxReleaseObjCfg(cfg);
}

std::string nameOf(int64_t index) {
  return "growth" + std::to_string(index);
}

// A stride that visits every name in an order that is not that of their making.
int64_t shuffled(int64_t index, int64_t size) {
  return index * 7919 % size;
}

Steps measureObjects(int64_t size) {
  QlxOpenToolkit(nullptr, nullptr);
  std::vector<QlxObject *> objects;
  const double create = secondsOf([&] {
    for (int64_t i = 0; i < size; i++) {
      objects.push_back(QlxGetObject(nameOf(i).c_str(), "qlx_levelfilter"));
      if (!objects.back()) fail("an object was not made");
    }
  });
  const double find = secondsOf([&] {
    for (int64_t i = 0; i < size; i++) {
      const int64_t index = shuffled(i, size);
      QlxObject *object = QlxGetObject(nameOf(index).c_str(), nullptr);
      if (object != objects[index]) fail("another object was found");
      QlxReleaseObject(object);
    }
  });
  const double release = secondsOf([&] {
    for (int64_t i = 0; i < size; i++) QlxReleaseObject(objects[shuffled(i, size)]);
  });
  return {create, find, release};
}

Steps measureConfigurations(int64_t size) {
  QlxOpenToolkit(nullptr, nullptr);
  const double create = secondsOf([&] {
    for (int64_t i = 0; i < size; i++) set(nameOf(i).c_str(), "level", "INFO");
  });
  const double find = secondsOf([&] {
    for (int64_t i = 0; i < size; i++) {
      if (!QlxLogMgrHasCfg(nameOf(shuffled(i, size)).c_str())) fail("a configuration is missing");
    }
  });
  const double release = secondsOf([&] {
    for (int64_t i = 0; i < size; i++) {
      ObjCfg *cfg = QlxLogMgrGetCfg(nameOf(shuffled(i, size)).c_str());
      QlxLogMgrRemCfg(cfg);
      QlxReleaseObjCfg(cfg);
    }
  });
  return {create, find, release};
}

// A file of so many lines, four for each name.
Steps measureFile(int64_t size) {
  const std::string path = gFolder + "/growth.properties";
  std::ofstream file(path);
  static constexpr const char *kProperties[] = {"className=qlx_levelfilter", "level=INFO",
                                                "description=one of many",
                                                "listenerNames=another third"};
  for (int64_t i = 0; i < size; i++) {
    file << nameOf(i / 4) << '.' << kProperties[i % 4] << '\n';
  }
  file.close();
  const double open = secondsOf([&] {
    if (!QlxOpenToolkit(path.c_str(), nullptr)) fail("the configuration was not read");
  });
  return {open};
}

int64_t gSeen;

void countEvent(QlxObject *, Event *, va_list *) {
  gSeen++;
}

// Runs `log` so often that it takes about as long for every size; seconds for `size` times.
Steps secondsOfRecords(int64_t size, int64_t records, const std::function<void()> &log) {
  log();
  const int64_t count = std::clamp<int64_t>(records / std::max<int64_t>(size, 1), 20, 10'000);
  const double seconds = secondsOf([&] {
    for (int64_t i = 0; i < count; i++) log();
  });
  return {seconds / static_cast<double>(count) * static_cast<double>(std::max<int64_t>(size, 1))};
}

// Listeners that only count: what the logger itself costs.
Steps measureListeners(int64_t size) {
  QlxOpenToolkit(nullptr, nullptr);
  QlxAddHandlerClass("growth_counter", nullptr, nullptr, nullptr, nullptr, countEvent, nullptr,
                     nullptr);
  QlxObject *logger = QlxGetObject("growth", "qlx_basiclogger");
  for (int64_t i = 0; i < size; i++) {
    if (!QlxAddListener(logger, QlxGetObject(nameOf(i).c_str(), "growth_counter"))) {
      fail("no listener");
    }
  }
  gSeen = 0;
  const Steps steps = secondsOfRecords(size, 1'000'000, [&] { QlxLogUText(logger, u"text"); });
  if (gSeen % size != 0 || gSeen == 0) fail("a listener was left out");
  return steps;
}

int64_t gProperties;

void addProperties(QlxObject *filter, Event *event, va_list *args) {
  for (int64_t i = 0; i < gProperties; i++) {
    QlxSetEventProp(event, nameOf(i).c_str(), "a value");
  }
  QlxBasicObjectFLog(filter, event, args);
}

void openFile() {
  set("growthFile", "className", "qlx_filehandler");
  set("growthFile", "fileName", gFolder + "/growth.log");
  set("growthFile", "maxFileBytes", "100000000");
}

// A process that has logged for a while asks for changes of the path in a cheaper way.
void warmUp(QlxObject *logger) {
  for (int i = 0; i < 25'000; i++) QlxLogUText(logger, u"text");
}

// A filter of the host's gives each event so many properties, then a file gets it.
Steps measureProperties(int64_t size) {
  QlxOpenToolkit(nullptr, nullptr);
  QlxAddFilterClass("growth_properties", nullptr, nullptr, nullptr, QlxBasicObjectFCfgChange,
                    addProperties, nullptr, nullptr);
  openFile();
  set("growthFilter", "className", "growth_properties");
  set("growthFilter", "listenerNames", "growthFile");
  set("growth", "listenerNames", "growthFilter");
  QlxObject *logger = QlxGetObject("growth", "qlx_basiclogger");
  warmUp(logger);
  gProperties = size;
  const Steps steps = secondsOfRecords(size, 200'000, [&] {
    if (QlxLogUText(logger, u"text").statusKind != '-') fail("a record was not written");
  });
  if (std::filesystem::file_size(gFolder + "/growth.log") == 0) fail("the events went elsewhere");
  return steps;
}

Steps measureLength(int64_t size) {
  QlxOpenToolkit(nullptr, nullptr);
  openFile();
  set("growth", "listenerNames", "growthFile");
  QlxObject *logger = QlxGetObject("growth", "qlx_basiclogger");
  warmUp(logger);
  const std::u16string text(size, u'x');
  return secondsOfRecords(size, 20'000'000, [&] {
    if (QlxLogUText(logger, text.c_str()).statusKind != '-') fail("a record was not written");
  });
}

// ---- The series ----

struct Line {
  const char *name;
  const char *colour;
};

struct Series {
  std::vector<int64_t> sizes;
  Steps (*measure)(int64_t size);
  std::vector<Line> lines;  // one for each step
  bool perRecord;           // the cost is of one record, else of one of the `size` things
};

const std::vector<Series> kSeries = {
    {{10, 1000, 100'000},
     measureObjects,
     {{"objects: create", "#1f77b4"},
      {"objects: look up", "#6baed6"},
      {"objects: release", "#08306b"}},
     false},
    {{10, 1000, 100'000},
     measureConfigurations,
     {{"configurations: create", "#2ca02c"},
      {"configurations: look up", "#98df8a"},
      {"configurations: release", "#00441b"}},
     false},
    {{10, 100, 1000, 10'000, 100'000},
     measureFile,
     {{"configuration file, a line", "#8c564b"}},
     false},
    {{1, 10, 100, 1000}, measureListeners, {{"a record, by listeners", "#d62728"}}, true},
    {{0, 1, 10, 30, 100}, measureProperties, {{"a record, by properties", "#ff7f0e"}}, true},
    {{10, 100, 1000, 10'000, 100'000, 1'000'000},
     measureLength,
     {{"a record, by bytes of text", "#9467bd"}},
     true},
};

struct Point {
  const Line *line;
  int64_t size;
  double nanoseconds;  // of one thing or record; below 0: it took too long
};

// The steps of one point, from a child; false when it ran out of time.
bool measureInChild(const Series &series, int64_t size, unsigned limit, Steps &steps) {
  std::filesystem::remove_all(gFolder);
  std::filesystem::create_directories(gFolder);
  int ends[2];
  if (pipe(ends) != 0) fail("no pipe");
  fflush(stdout);
  const pid_t child = fork();
  if (child == 0) {
    alarm(limit);
    const Steps measured = series.measure(size);
    _exit(write(ends[1], &measured, sizeof measured) != sizeof measured);
  }
  close(ends[1]);
  const bool got = read(ends[0], &steps, sizeof steps) == sizeof steps;
  close(ends[0]);
  int status = 0;
  waitpid(child, &status, 0);
  const bool late = WIFSIGNALED(status) && WTERMSIG(status) == SIGALRM;
  if (!got && !late) fail("a measurement failed");
  return got;
}

std::vector<Point> measureAll(unsigned limit) {
  std::vector<Point> points;
  for (const Series &series : kSeries) {
    for (const int64_t size : series.sizes) {
      Steps steps{};
      const bool inTime = measureInChild(series, size, limit, steps);
      const double things = static_cast<double>(std::max<int64_t>(size, 1));
      for (size_t i = 0; i < series.lines.size(); i++) {
        const double each = inTime ? steps[i] / things * 1e9 : -1;
        points.push_back({&series.lines[i], size, each});
      }
    }
  }
  return points;
}

void printTable(const std::vector<Point> &points, unsigned limit) {
  puts("| | size | ns each | s in all |\n|---|---|---|---|");
  const auto isPerRecord = [](const Line *line) {
    return std::string(line->name).starts_with("a record");
  };
  for (const Point &point : points) {
    printf("| %s | %lld | ", point.line->name, static_cast<long long>(point.size));
    if (point.nanoseconds < 0) {
      printf("ended after %u s | |\n", limit);
    } else if (isPerRecord(point.line)) {
      printf("%.0f | |\n", point.nanoseconds);
    } else {
      printf("%.0f | %.4f |\n", point.nanoseconds,
             point.nanoseconds * static_cast<double>(point.size) / 1e9);
    }
  }
}

// ---- The chart: both axes logarithmic ----

constexpr double kLeft = 70, kTop = 30, kWidth = 560, kHeight = 420;
constexpr int kSizeDecades = 6, kFirstCost = 1, kCostDecades = 7;  // 1 to 10^6; 10^1 to 10^8 ns

double x(int64_t size) {
  return kLeft +
         kWidth * std::log10(static_cast<double>(std::max<int64_t>(size, 1))) / kSizeDecades;
}
double y(double nanoseconds) {
  const double place = (std::log10(nanoseconds) - kFirstCost) / kCostDecades;
  return kTop + kHeight * (1 - std::clamp(place, 0.0, 1.0));
}

void drawGrid(FILE *svg) {
  for (int i = 0; i <= kSizeDecades; i++) {
    const double at = kLeft + kWidth * i / kSizeDecades;
    fprintf(svg, "<path d=\"M%.1f %.1fv%.1f\" stroke=\"#ddd\"/>\n", at, kTop, kHeight);
    fprintf(svg,
            "<text x=\"%.1f\" y=\"%.1f\" text-anchor=\"middle\">10<tspan dy=\"-5\" "
            "font-size=\"9\">%d</tspan></text>\n",
            at, kTop + kHeight + 20, i);
  }
  for (int i = 0; i <= kCostDecades; i++) {
    static constexpr const char *kNames[] = {"10 ns",  "100 ns", "1 µs",  "10 µs",
                                             "100 µs", "1 ms",   "10 ms", "100 ms"};
    const double at = kTop + kHeight - kHeight * i / kCostDecades;
    fprintf(svg, "<path d=\"M%.1f %.1fh%.1f\" stroke=\"#ddd\"/>\n", kLeft, at, kWidth);
    fprintf(svg, "<text x=\"%.1f\" y=\"%.1f\" text-anchor=\"end\">%s</text>\n", kLeft - 8, at + 4,
            kNames[i]);
  }
}

void drawLine(FILE *svg, const std::vector<Point> &points, const Line &line) {
  std::string path, dots;
  for (const Point &point : points) {
    if (point.line != &line || point.nanoseconds < 0) continue;
    char text[128];
    snprintf(text, sizeof text, "%s%.1f %.1f", path.empty() ? "M" : " L", x(point.size),
             y(point.nanoseconds));
    path += text;
    snprintf(text, sizeof text, "<circle cx=\"%.1f\" cy=\"%.1f\" r=\"3\" fill=\"%s\"/>\n",
             x(point.size), y(point.nanoseconds), line.colour);
    dots += text;
  }
  fprintf(svg, "<path d=\"%s\" fill=\"none\" stroke=\"%s\" stroke-width=\"2\"/>\n%s", path.c_str(),
          line.colour, dots.c_str());
}

void drawChart(const char *path, const std::vector<Point> &points) {
  FILE *svg = fopen(path, "w");
  if (!svg) fail("the chart cannot be written");
  fprintf(svg,
          "<svg xmlns=\"http://www.w3.org/2000/svg\" viewBox=\"0 0 880 500\" "
          "font-family=\"sans-serif\" font-size=\"13\">\n"
          "<rect width=\"880\" height=\"500\" fill=\"white\"/>\n"
          "<text x=\"%.1f\" y=\"18\">cost of each, or of a record, against size</text>\n",
          kLeft);
  drawGrid(svg);
  double at = kTop + 12;
  for (const Series &series : kSeries) {
    for (const Line &line : series.lines) {
      drawLine(svg, points, line);
      fprintf(svg,
              "<path d=\"M%.1f %.1fh20\" stroke=\"%s\" stroke-width=\"2\"/>"
              "<text x=\"%.1f\" y=\"%.1f\">%s</text>\n",
              kLeft + kWidth + 20, at - 4, line.colour, kLeft + kWidth + 46, at, line.name);
      at += 20;
    }
  }
  fputs("</svg>\n", svg);
  if (fclose(svg) != 0) fail("the chart cannot be written");
}

}  // namespace

int main(int argc, char **argv) {
  if (argc < 3) {
    fprintf(stderr, "usage: qlx_growth FOLDER CHART.svg [SECONDS]\n");
    return 2;
  }
  gFolder = std::string(argv[1]) + "/growth";
  const unsigned limit = argc > 3 ? atoi(argv[3]) : 20;
  const std::vector<Point> points = measureAll(limit);
  printTable(points, limit);
  drawChart(argv[2], points);
  std::filesystem::remove_all(gFolder);
  return 0;
}
