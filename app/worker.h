// One task at a time on a second thread, for work the run can do while it
// waits for the disk. Start hands a task over, Wait returns once it is done
// (rethrowing what it threw); everything the task touched is then the
// caller's again, as if it had run the task itself.
#ifndef HF_APP_WORKER_H_
#define HF_APP_WORKER_H_

#include <condition_variable>
#include <exception>
#include <functional>
#include <mutex>
#include <thread>

class Worker {
 public:
  Worker();
  ~Worker();  // waits for a task still running
  Worker(const Worker&) = delete;
  Worker& operator=(const Worker&) = delete;

  // Only when no task is running.
  void Start(std::function<void()> task);
  void Wait();

 private:
  void Loop();

  std::mutex mutex_;
  std::condition_variable changed_;
  std::function<void()> task_;
  bool running_ = false;
  bool quit_ = false;
  std::exception_ptr error_;
  std::thread thread_;  // last: started once the members above exist
};

#endif  // HF_APP_WORKER_H_
