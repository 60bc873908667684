# What vlmbind may do once it runs. It confines itself to these rules before it looks at its
# arguments, and cannot leave them again.
#
#     read PATH      read the file, or everything beneath the folder
#     write PATH     that, and change, make and remove what is there
#     socket unix    open sockets of the unix family
#
# What no rule allows is denied. Denied whatever a rule says: starting programs, network sockets,
# looking into other processes, mounts and namespaces, loading code into the kernel, changing owner
# or mode of a file. A path that does not exist is passed over; one that appears later stays closed
# to a program that runs already. Folders are named where single files would do, since a file that
# is replaced while the program runs is not the file that the rule was made for.
#
# $(HOME_DIR), $(KESTRA_USER_CACHE_DIR) and $(KESTRA_USER_TEMP_DIR) are the folders of the user who
# runs the program, $(CONFIG_DIR) is the one of his preferences, $(INSTALL_DIR) is the folder above
# the program's own.

# The C library, the modules that look up accounts, locales, time zones, character sets.
read /usr
read /lib
read /lib32
read /lib64

# Settings, among them /etc/SmartcardLogin.plist and /etc/vlm; the accounts and where to look them
# up; the machine's id.
read /etc

# What the machine knows of its fonts: without it, showing a window opens every one of them.
read /var/cache/fontconfig

# The program's own parts, when it is not installed in /usr. No other folder there: above a program
# in somebody's home folder lies that home folder.
read $(INSTALL_DIR)/lib
read $(INSTALL_DIR)/share/locale
read $(INSTALL_DIR)/share/vlm

# Accounts of directory services: memory that their daemons share, and where to ask them.
read /run/nscd
read /run/systemd/userdb
read /var/lib/extrausers
read /var/lib/sss/mc

# Who is logged in, and who sits at the machine.
read /run/systemd/seats
read /run/systemd/sessions
read /run/systemd/users

# Itself, and what the kernel says about the machine. Not all of /proc: root could read there what
# other programs were given in their environment.
read /proc/self
read /proc/sys
read /proc/cpuinfo
read /proc/meminfo
read /proc/stat

# Randomness; nothing.
read /dev/random
read /dev/urandom
write /dev/null

# The user's own preferences, and room for passing data.
write $(CONFIG_DIR)
write $(KESTRA_USER_CACHE_DIR)
write $(KESTRA_USER_TEMP_DIR)

# The message bus, the journal, the services that know accounts.
socket unix
