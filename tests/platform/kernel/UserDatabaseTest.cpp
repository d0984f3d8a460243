// Which configurations of the user database need the network.
#include <gtest/gtest.h>

#include "kernel/UserDatabase.h"

namespace tallowmere::kernel {
namespace {

class WithoutNetwork : public testing::TestWithParam<const char*> {};

TEST_P(WithoutNetwork, UsersAreFound) {
  EXPECT_FALSE(NeedsNetwork(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(Users, WithoutNetwork,
                         testing::Values("", "passwd: files\n", "passwd:files systemd",
                                         "passwd:\tsss\tfiles\n",
                                         "  passwd: files [NOTFOUND=return UNAVAIL=continue] db\n",
                                         "passwd: files[!SUCCESS=continue]winbind extrausers\n",
                                         "group: ldap\nhosts: files dns\npasswd: files # nis\n",
                                         "# passwd: ldap\n", "passwd_compat: nis\npasswd: files\n",
                                         "passwd", "passwd:"));

class WithNetwork : public testing::TestWithParam<const char*> {};

TEST_P(WithNetwork, UsersAreFound) {
  EXPECT_TRUE(NeedsNetwork(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(Users, WithNetwork,
                         testing::Values("passwd: ldap", "passwd: files nis\n",
                                         "passwd : files ldap\n", "passwd: compat\n",
                                         "passwd: files [NOTFOUND=return] hesiod\n",
                                         "passwd: files[NOTFOUND=continue]ldap",
                                         "group: files\n\tpasswd:ldap # files\n",
                                         "passwd: files\npasswd: files ldap\n", "passwd: FILES\n"));

}  // namespace
}  // namespace tallowmere::kernel
