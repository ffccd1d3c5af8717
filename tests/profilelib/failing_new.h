#ifndef QUO_TESTS_FAILING_NEW_H
#define QUO_TESTS_FAILING_NEW_H

namespace test {

/** How many allocations by `new` still succeed in this process; any number while negative. */
extern long allowed_news;

}  // namespace test

#endif
