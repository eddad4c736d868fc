#include "app/worker.h"

#include <utility>

Worker::Worker() : thread_([this] { Loop(); }) {}

Worker::~Worker() {
  {
    std::unique_lock<std::mutex> lock(mutex_);
    changed_.wait(lock, [this] { return !running_; });
    quit_ = true;
  }
  changed_.notify_all();
  thread_.join();
}

void Worker::Start(std::function<void()> task) {
  {
    std::lock_guard<std::mutex> lock(mutex_);
    task_ = std::move(task);
    running_ = true;
  }
  changed_.notify_all();
}

void Worker::Wait() {
  std::unique_lock<std::mutex> lock(mutex_);
  changed_.wait(lock, [this] { return !running_; });
  if (error_) std::rethrow_exception(std::exchange(error_, nullptr));
}

void Worker::Loop() {
  std::unique_lock<std::mutex> lock(mutex_);
  for (;;) {
    changed_.wait(lock, [this] { return quit_ || task_; });
    if (quit_) return;
    std::function<void()> task = std::move(task_);
    task_ = nullptr;
    lock.unlock();
    std::exception_ptr error;
    try {
      task();
    } catch (...) {
      error = std::current_exception();
    }
    lock.lock();
    error_ = error;
    running_ = false;
    changed_.notify_all();
  }
}
