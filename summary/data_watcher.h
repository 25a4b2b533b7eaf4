// What the main window starts once it is up and stops before it goes: the watch over the
// loaded data files, which is built above the window. The program hands an implementation
// to the window with its input.
#pragma once

class KG_SumFrame;

class KG_DataWatcher {
 public:
  virtual ~KG_DataWatcher() = default;
  // The window is built and shows its data; the watcher may use it until stop.
  virtual void start(KG_SumFrame& frame) = 0;
  virtual void stop() = 0;
};
