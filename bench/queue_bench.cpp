// What handing a request to the executor costs, beside the least that any hand-over between threads costs: a bare
// mutex, condition variable and deque with a payload of the same size.

#include <benchmark/benchmark.h>
#include <pthread.h>

#include <atomic>
#include <cstdint>
#include <deque>
#include <thread>

#include "tasks/task_manager.h"
#include "tasks/task_queue.h"

namespace {

/// Runs `take` again and again in a thread of its own. Hands one item over for each iteration, and only when the
/// thread has received the one before, so that it has gone back to waiting and must be woken each time.
template <class Give, class Take>
void handOver(benchmark::State& state, Give give, Take take) {
  std::atomic<uint64_t> received = 0;
  std::atomic<uint64_t> last = UINT64_MAX;
  std::thread taker([&] {
    do {
      take();
    } while (received.fetch_add(1, std::memory_order_acq_rel) + 1 != last.load(std::memory_order_acquire));
  });
  uint64_t given = 0;
  const auto handOne = [&] {
    give();
    ++given;
    while (received.load(std::memory_order_acquire) != given) std::this_thread::yield();
  };
  for (auto _ : state) handOne();
  last = given + 1;
  handOne();
  taker.join();
}

void theQueue(benchmark::State& state) {
  initializeTaskQueue();
  const TaskQueueElem request("node7.example.com", "0123456789abcdef-42", "START", "ux", "", "INSTANCE", "", "",
                              "062000", "inst1:node7:UX");
  handOver(
      state, [&] { queueTask(request); }, [] { benchmark::DoNotOptimize(takeTask()); });
}

struct Payload {
  char bytes[sizeof(TaskQueueElem)];
};

void bareQueue(benchmark::State& state) {
  pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
  pthread_cond_t filled = PTHREAD_COND_INITIALIZER;
  std::deque<Payload> queue;
  const Payload payload{};
  handOver(
      state,
      [&] {
        pthread_mutex_lock(&mutex);
        queue.push_back(payload);
        pthread_cond_signal(&filled);
        pthread_mutex_unlock(&mutex);
      },
      [&] {
        pthread_mutex_lock(&mutex);
        while (queue.empty()) pthread_cond_wait(&filled, &mutex);
        Payload taken = queue.front();
        queue.pop_front();
        pthread_mutex_unlock(&mutex);
        benchmark::DoNotOptimize(taken);
      });
}

BENCHMARK(theQueue)->UseRealTime();
BENCHMARK(bareQueue)->UseRealTime();

}  // namespace
