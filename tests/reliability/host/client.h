/**
 * A client of the platform in a process of its own, with whatever habits clients have.
 */
#ifndef VORNOVS_TESTS_RELIABILITY_HOST_CLIENT_H
#define VORNOVS_TESTS_RELIABILITY_HOST_CLIENT_H

#include <functional>
#include <string>
#include <vector>

namespace reliability {

/** One habit. */
struct Trait {
    const char* name;
    std::function<void()> take;
};

/** What a client finds wrong; the test that started it reads it. */
class Findings {
public:
    Findings();
    Findings(const Findings&) = delete;
    Findings& operator=(const Findings&) = delete;
    ~Findings();

    /** Notes the words down unless it is as it should be. Needs no descriptor and no memory. */
    void Expect(bool asItShouldBe, const char* words, const char* more = "");
    [[nodiscard]] std::string Text() const;

    /** What the client was answered. */
    void SetResult(int result);
    [[nodiscard]] int Result() const;

private:
    struct Page;
    Page* m_page; ///< shared with the client
};

/** What a client gets when it has taken longer than anything may. */
constexpr unsigned kClientSeconds = 90;

/**
 * Runs a client that takes these habits and then does what the body says. Its signals, their mask
 * and its descriptors must be afterwards what they were before, and no child may be left.
 * @return  what was found wrong, one line each; empty: nothing.
 */
std::string RunClient(const std::vector<Trait>& traits, const std::function<void(Findings&)>& body);

/** The same, for the answer's sake too. */
void RunClient(const std::vector<Trait>& traits, const std::function<void(Findings&)>& body,
               Findings& findings);

} // namespace reliability

#endif
