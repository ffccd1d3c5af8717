#ifndef QUO_TESTS_SUPPORT_FAILING_NEW_H
#define QUO_TESTS_SUPPORT_FAILING_NEW_H

/* A program that failing_new.cpp is linked into has operators `new` that fail on demand. */

namespace test {

/** Which operators fail; kNone where is_refused() is asked below them. */
enum class News { kThrowing, kReturningNull, kAll, kNone };

/** Lets `room` more allocations by such operators succeed; after them one fails, or all do. */
void fail_news(long room, News which = News::kAll, bool once = false);
/** Lets all succeed again, and sets errno to 0. Whether any failed. */
bool stop_failing();
/** Begins to count the bytes that such operators hand out. */
void watch_news();
/** The most bytes beyond those of the beginning that were in use at one time since then. */
long most_news();
/** For allocators of another kind that are to share the room: whether the allocation asked for must fail. */
bool is_refused();

}  // namespace test

#endif
