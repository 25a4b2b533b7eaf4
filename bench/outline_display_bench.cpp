// Cost of the outline's drawing on a private X server: expanding and collapsing a directory of
// 1000 rows, scrolling a page of a long text, and redrawing rows whose text did not change.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_outline_display.h"
#include "outline/qr_oi_scroll_text.h"
#include "outline/qr_outline_root.h"
#include "outline/qr_outline_text.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_grid_box.h"
#include "toolkit/oi_window.h"

namespace {

// A window with an outline of one directory row holding `children` rows.
struct Scene {
  std::unique_ptr<OI_TopLevel> window;
  OI_GridBox* box = nullptr;
  QR_OI_ScrollText* scroll = nullptr;
  QR_OutlineRoot* root = nullptr;
  QR_OutlineText* dir = nullptr;

  explicit Scene(int children) {
    window = std::make_unique<OI_TopLevel>("bench", "Bench");
    box = window->own(std::make_unique<OI_GridBox>(window->mainWindow(), "box"));
    window->setWorkArea(box->widget());
    scroll = box->own(std::make_unique<QR_OI_ScrollText>(box->widget(), "kgOutline"));
    box->place(scroll->widget(), 0, 0, true, true);
    scroll->text()->setRows(40);
    root = new QR_OutlineRoot(new QR_OI_OutlineDisplay(scroll));
    dir = new QR_OutlineText("src/\t1000");
    dir->make_expandable();
    root->add_child(dir);
    for (int i = 0; i < children; ++i) {
      auto* row = new QR_OutlineText(("file" + std::to_string(i) + ".c\t" + std::to_string(i)).c_str());
      row->make_selectable();
      dir->add_child(row);
    }
    box->fitToContents();
    window->show();
    settle();
  }
  ~Scene() {
    delete root;
    window.reset();
  }
  void settle() {
    OI_Application* app = OI_Application::instance();
    scroll->text()->redisplay();
    XSync(app->display(), False);
    app->processPending();
  }
};

void BM_ExpandAndCollapse1000Rows(benchmark::State& state) {
  Scene scene(1000);
  for (auto _ : state) {
    scene.root->select_exclusively(scene.dir);
    scene.root->perform_action("QR_OutlineExpand", nullptr);
    scene.settle();
    scene.root->perform_action("QR_OutlineCollapse", nullptr);
    scene.settle();
  }
}
BENCHMARK(BM_ExpandAndCollapse1000Rows)->Unit(benchmark::kMillisecond);

void BM_ScrollOnePageOfAnExpandedOutline(benchmark::State& state) {
  Scene scene(1000);
  scene.dir->expand();
  scene.settle();
  OI_MultiText* text = scene.scroll->text();
  bool down = true;
  for (auto _ : state) {
    if (text->topLine() + 2 * text->visibleLines() >= text->lineCount()) down = false;
    if (text->topLine() < text->visibleLines()) down = true;
    if (down) text->pageDown();
    else text->pageUp();
    scene.settle();
  }
}
BENCHMARK(BM_ScrollOnePageOfAnExpandedOutline)->Unit(benchmark::kMicrosecond);

void BM_RedrawRowsThatDidNotChange(benchmark::State& state) {
  Scene scene(1000);
  scene.dir->expand();
  scene.settle();
  QR_OutlineDisplay* display = scene.root->outline_display();
  for (auto _ : state) {
    for (uint32_t i = 0; i < 40; ++i) {
      QR_OutlineObject* row = scene.root->object_at_line(i);
      display->set_line(row->depth(), i, row->line_text(0), row);
    }
    scene.settle();
  }
}
BENCHMARK(BM_RedrawRowsThatDidNotChange)->Unit(benchmark::kMicrosecond);

// A private Xvfb when no display is given, so that the benchmark never draws on the user's screen
// unless asked to.
pid_t startXvfb(std::string& display) {
  int fds[2];
  if (pipe(fds) != 0) return -1;
  pid_t pid = fork();
  if (pid == 0) {
    close(fds[0]);
    int devnull = open("/dev/null", O_RDWR);
    dup2(devnull, 1);
    dup2(devnull, 2);
    std::string fd = std::to_string(fds[1]);
    execlp("Xvfb", "Xvfb", "-displayfd", fd.c_str(), "-screen", "0", "1280x1024x24", "-nolisten", "tcp",
           static_cast<char*>(nullptr));
    _exit(127);
  }
  close(fds[1]);
  std::string number;
  char c;
  pollfd p{fds[0], POLLIN, 0};
  while (poll(&p, 1, 20000) > 0 && read(fds[0], &c, 1) == 1 && c != '\n') number += c;
  close(fds[0]);
  display = number.empty() ? "" : ":" + number;
  return pid;
}

}  // namespace

int main(int argc, char** argv) {
  std::string display;
  pid_t xvfb = -1;
  const char* given = getenv("KG_BENCH_DISPLAY");
  if (given && *given) {
    display = given;
  } else {
    xvfb = startXvfb(display);
  }
  int status = 1;
  std::vector<std::string> xargs{argv[0], "-display", display};
  std::vector<char*> xargv;
  for (auto& a : xargs) xargv.push_back(a.data());
  int xargc = static_cast<int>(xargv.size());
  xargv.push_back(nullptr);
  std::string error;
  if (!display.empty() && OI_Application::open(xargc, xargv.data(), error)) {
    QR_OI_Init();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    OI_Application::close();
    status = 0;
  } else {
    fprintf(stderr, "outline_display_bench: no X server (%s)\n", error.c_str());
  }
  if (xvfb > 0) {
    kill(xvfb, SIGTERM);
    waitpid(xvfb, nullptr, 0);
  }
  return status;
}
