#pragma once

#include "BSet.h"
#include "ID.h"
#include "TestText.h"
#include "Uris.h"

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

// A user of the users list, in UTF-8.
struct User
{
    std::string name;
    std::string address;
    std::string phone;
    bool operator==(const User& other) const
    {
        return name == other.name && address == other.address && phone == other.phone;
    }
};

inline void PrintTo(const User& u, std::ostream* os)
{
    *os << "{" << u.name << " | " << u.address << " | " << u.phone << "}";
}

const User kAnna{"Anna", "1 Quay Road", "0101"};
const User kBruno{"Bruno", "2 Mill Lane", "0202"};
const User kClara{"Clara", "3 Hill Street", "0303"};
const User kLukasz{"Łukasz Żółć", "ul. Źródlana 5, Kraków", "+48 12 345 67 89"};

// The users published under "User#0".."User#n-1", in index order.
template <class DataManager>
std::vector<User> publishedUsers(DataManager& dataManager)
{
    BSet users(10);
    EXPECT_EQ(dataManager.getData(ID(Uri::kUserSet), users), 0);
    std::vector<User> result;
    for (int i = 0; i < users.size(); ++i)
    {
        BSet entry(10);
        if (users.getSet(wide("User#" + std::to_string(i)), entry) != 0)
        {
            ADD_FAILURE() << "missing key User#" << i;
            continue;
        }
        ACE_WString name, address, phone;
        entry.getString(L"name"_w, name);
        entry.getString(L"address"_w, address);
        entry.getString(L"phone"_w, phone);
        result.push_back({utf8(name), utf8(address), utf8(phone)});
    }
    return result;
}
